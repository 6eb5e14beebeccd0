// The console handler: each event as text on the standard output stream, after the formatter's
// header and before its trailer.
#include <qlx/class/handler.h>

#include <cstdio>

#include <qlx/class/message.h>
#include <qlx/class/object.h>
#include <qlx/memory.h>
#include <qlx/ustring.h>

#include "object/QlxClasses.h"
#include "object/QlxObjClass.h"
#include "QlxObject.h"

// The variables: 1 after the header was written, 0 at first and after the trailer.
static uint8_t *openedFlag(QlxObject *handler) {
  return handler ? static_cast<uint8_t *>(handler->vars) : nullptr;
}

void *QlxConsoleHandlerFAllocVars(void) {
  return OslMemoryCalloc(1, sizeof(uint8_t));
}

void QlxConsoleHandlerFFreeVars(void *vars) {
  OslMemoryFree(vars);
}

// Deliberate: the text gets a line feed of its own, so that one which ends with a line feed is
// followed by an empty line.
static void print(const UChar *text) {
  qlxI18PrintUCharAsLocal(stdout, text);
}

// Prints a header or a trailer and frees it; null prints nothing.
static void printFrame(char *frame) {
  const OwnedStr text{frame};
  const OwnedUStr wide{CxUStringDupStrToUChar(text.get())};
  print(wide.get());
}

void QlxConsoleHandlerFOpen(QlxObject *handler) {
  uint8_t *opened = openedFlag(handler);
  if (!opened || *opened == 1) return;
  printFrame(qlxIntlHandlerGetFmtHeader(handler));
  *opened = 1;
}

void QlxConsoleHandlerFClose(QlxObject *handler) {
  uint8_t *opened = openedFlag(handler);
  if (!opened || *opened == 0) return;
  printFrame(qlxIntlHandlerGetFmtTrailer(handler));
  *opened = 0;
}

void QlxConsoleUHandlerFProcess(QlxObject *handler, Event *event, va_list *args) {
  const uint8_t *opened = openedFlag(handler);
  if (!opened || !event || !loadEnabled(handler)) return;
  if (*opened == 0) QlxConsoleHandlerFOpen(handler);
  if (const OwnedUStr text{qlxIntlUHandlerDoFmt(handler, event, args)}) print(text.get());
  QlxBasicObjectFLog(handler, event, args);
}

const ObjClass qlxConsoleHandlerClass = {
    .kind = Handler,
    .name = "qlx_consolehandler",
    .description = nullptr,
    .op1 = {.fProcess = QlxConsoleUHandlerFProcess},
    .op2 = {.fOpen = QlxConsoleHandlerFOpen},
    .op3 = {.fClose = QlxConsoleHandlerFClose},
    .fAllocVars = QlxConsoleHandlerFAllocVars,
    .fFreeVars = QlxConsoleHandlerFFreeVars,
    .fCfgChange = QlxBasicHandlerFCfgChange,
    .own = &kTakesNotes,
};
