/**
 * @file
 * The twins of the container functions, for class operations: the caller holds the API lock.
 */
#ifndef QLX_CLASS_CONTAINERS_H
#define QLX_CLASS_CONTAINERS_H

#include <qlx/class/containers/ListenerGroup.h>
#include <qlx/class/containers/ParmList.h>
#include <qlx/class/containers/StringGroup.h>
#include <qlx/class/containers/StringList.h>
#include <qlx/class/containers/StringToObjCfgMap.h>
#include <qlx/class/containers/StringToObjClassMap.h>
#include <qlx/class/containers/StringToObjMap.h>
#include <qlx/class/containers/StringToStringMap.h>

#endif
