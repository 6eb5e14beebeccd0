// The last step of truncating, for itself.
#ifndef QLX_SRC_CXFILE_H
#define QLX_SRC_CXFILE_H

#include <qlx/files.h>

QLX_BEGIN_DECLS

// 22 when the file has a byte; a failed look at it gives its errno.
CxStatus cxIntlFileCheckEmpty(CxFile file);

QLX_END_DECLS

#endif
