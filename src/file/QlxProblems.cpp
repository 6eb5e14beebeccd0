// Failures are reported, stored in their event, and counted for qlxIntlGetHandlerProblems().
#include "QlxProblems.h"

#include <qlx/class/handler.h>
#include <qlx/memory.h>
#include <qlx/toolkit.h>

static QlxHandlerProblems gProblems;

void qlxKeepFailure(Event *event, CxStatus status) {
  if (!cxFailed(status)) return;
  QlxReportPlatformErr(status);
  if (event) event->status = status;
}

void qlxCountLost(Event *event, CxStatus status) {
  qlxKeepFailure(event, status);
  ++gProblems.recordsLost;
}

void qlxKeepRollover(Event *event, CxStatus status, const char *activeFile) {
  qlxKeepFailure(event, status);
  if (!cxFailed(status)) return;
  ++gProblems.rolloversFailed;
  gProblems.rollover = status;
  gProblems.rolloverFile[0] = '\0';
  OslStringNCat(gProblems.rolloverFile, activeFile, sizeof gProblems.rolloverFile - 1);
}

void qlxIntlGetHandlerProblems(QlxHandlerProblems *problems) {
  if (problems) *problems = gProblems;
}
