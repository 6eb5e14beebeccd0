// The built-in classes as data: one record each, at the end of the class's own file. The toolkit
// registers them in the order of its list.
#ifndef QLX_SRC_QLXCLASSES_H
#define QLX_SRC_QLXCLASSES_H

#include <qlx/types.h>

extern const ObjClass qlxBasicLoggerClass;
extern const ObjClass qlxPDLoggerClass;
extern const ObjClass qlxLevelFilterClass;
extern const ObjClass qlxMsgIdFilterClass;
extern const ObjClass qlxConsoleHandlerClass;
extern const ObjClass qlxFileHandlerClass;
extern const ObjClass qlxMultiProcFileHandlerClass;
extern const ObjClass qlxBasicFormatterClass;
extern const ObjClass qlxPDXMLFormatterClass;
extern const ObjClass qlxVexTraceFormatterClass;

#endif
