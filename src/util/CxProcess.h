// The start of a program with the forking call as an argument, so that a test makes it fail.
#ifndef QLX_SRC_CXPROCESS_H
#define QLX_SRC_CXPROCESS_H

#include <sys/types.h>

#include <qlx/system.h>

QLX_BEGIN_DECLS

// CxProcessCreate() with fork() as `forkCall`.
CxStatus cxIntlProcessCreate(int64_t *id, const char *path, char *const arguments[],
                             pid_t (*forkCall)(void));

QLX_END_DECLS

#endif
