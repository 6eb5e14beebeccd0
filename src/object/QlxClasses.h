// The built-in classes: one record each, at the end of the class's own file.
#ifndef QLX_SRC_QLXCLASSES_H
#define QLX_SRC_QLXCLASSES_H

#include <qlx/types.h>

// The one list of them, in the order in which they are registered.
#define QLX_BUILTIN_CLASSES(CLASS)    \
  CLASS(qlxBasicLoggerClass)          \
  CLASS(qlxPDLoggerClass)             \
  CLASS(qlxLevelFilterClass)          \
  CLASS(qlxMsgIdFilterClass)          \
  CLASS(qlxConsoleHandlerClass)       \
  CLASS(qlxFileHandlerClass)          \
  CLASS(qlxMultiProcFileHandlerClass) \
  CLASS(qlxBasicFormatterClass)       \
  CLASS(qlxPDXMLFormatterClass)       \
  CLASS(qlxVexTraceFormatterClass)

#define QLX_DECLARE_CLASS(record) extern const ObjClass record;
QLX_BUILTIN_CLASSES(QLX_DECLARE_CLASS)
#undef QLX_DECLARE_CLASS

#endif
