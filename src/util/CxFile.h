// What the handlers that write files need beyond the public operations.
#ifndef QLX_SRC_CXFILE_H
#define QLX_SRC_CXFILE_H

#include <qlx/files.h>

QLX_BEGIN_DECLS

// Writes all of it: a short write goes on with the rest, an interrupted one is tried again. Adds
// what was written to *written, also when it fails in the end.
CxStatus cxFileWriteAll(CxFile *file, const char *bytes, uint32_t length, uint64_t *written);

// The last step of truncating, for itself: 22 when the file has a byte; a failed look at it gives
// its errno.
CxStatus cxIntlFileCheckEmpty(CxFile file);

QLX_END_DECLS

#endif
