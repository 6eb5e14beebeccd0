// References as a host holds them: given back under the lock, unlike ObjectRef and ObjCfgRef.
#ifndef QLX_TESTS_HANDLE_H
#define QLX_TESTS_HANDLE_H

#include <qlx/qlx.h>

#include "util/CxOwned.h"

using Handle = Owned<QlxObject, QlxReleaseObject>;
using CfgHandle = Owned<ObjCfg, QlxReleaseObjCfg>;

#endif
