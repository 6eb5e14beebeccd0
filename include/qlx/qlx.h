/**
 * @file
 * The whole interface of Qlx, for C11 and C++ hosts.
 */
#ifndef QLX_QLX_H
#define QLX_QLX_H

#include <qlx/types.h>

#include <qlx/buffers.h>
#include <qlx/config.h>
#include <qlx/containers.h>
#include <qlx/event.h>
#include <qlx/files.h>
#include <qlx/handler.h>
#include <qlx/kmsid.h>
#include <qlx/level.h>
#include <qlx/logger.h>
#include <qlx/macros.h>
#include <qlx/memory.h>
#include <qlx/message.h>
#include <qlx/object.h>
#include <qlx/proplist.h>
#include <qlx/props.h>
#include <qlx/system.h>
#include <qlx/toolkit.h>
#include <qlx/ustring.h>

#include <qlx/class.h>

#endif
