/**
 * @file
 * For hosts that bring classes of their own. Operations of a class run with the API lock held, so
 * they call only what takes no lock: the twins (qlxIntl...), the helpers (qlx...) and the
 * operations of the built-in classes (Qlx<Class>F<Operation>) declared here, besides the platform
 * layer and the functions whose headers say that they take no lock.
 *
 * No C++ exception may leave an operation, for nobody would give the lock back: one that does ends
 * the process (abort()) after a line on standard error, as in "qlx: an exception left the operation
 * fProcess of the class my_handler". So does an operation that ends its thread by pthread_exit().
 * While an operation runs, its thread cannot be cancelled; it is when the call that took the lock
 * returns.
 *
 * An operation of a built-in class takes the object's variables for those that the same class's
 * fAllocVars makes: a host's class with QlxPDLoggerFLog() has QlxPDLoggerFAllocVars() and
 * QlxPDLoggerFFreeVars() too, or operations that call them, and no variables of its own.
 */
#ifndef QLX_CLASS_H
#define QLX_CLASS_H

#include <qlx/class/config.h>
#include <qlx/class/containers.h>
#include <qlx/class/event.h>
#include <qlx/class/filter.h>
#include <qlx/class/formatter.h>
#include <qlx/class/handler.h>
#include <qlx/class/logger.h>
#include <qlx/class/message.h>
#include <qlx/class/msgid.h>
#include <qlx/class/object.h>
#include <qlx/class/props.h>
#include <qlx/class/toolkit.h>

#endif
