/* A small host in C whose messages carry identifiers, for problem determination. */
#include <stdio.h>

#include <qlx/class.h>
#include <qlx/qlx.h>

/* Whether the call's event reached all its places with its text. */
static int isWritten(QlxLogResult result) {
  return result.statusKind == '-' && result.msgStatus <= 0;
}

/*
 * An error that belongs to a job: the host makes the event itself, so that it can carry more than
 * the log calls give it, and hands it to the logger's class under the API lock.
 */
static int logJobError(QlxObject *logger, const char *job, const char *bundle, const char *key,
                       ...) {
  if (!QlxIsLoggable(logger, ERROR)) return 1;
  fLog log = QlxLoggerGetFLog(logger);
  Event *event = QlxVaAllocUEvent(ERROR, bundle, key, NULL);
  int ok = 0;
  QlxSetEventIsMessage(event, 1);
  QlxSetEventProp(event, "correlationId", job);
  if (log && event && qlxAPIMutexLock()) {
    va_list args;
    va_start(args, key);
    log(logger, event, &args);
    va_end(args);
    qlxAPIMutexUnlock();
    ok = event->status.kind == '-' && event->message && event->message->error <= 0;
  }
  QlxFreeEvent(event);
  return ok;
}

static int logBackup(QlxObject *logger, const char *bundle) {
  int ok = isWritten(QlxLogInfo(logger, bundle, "started", u"/home"));
  ok &= isWritten(QlxLogDebugMid(logger, "incident.c", __func__, __LINE__,
                                 u"{0,number,integer} files wait in {1}", (int32_t)1250, u"/home"));
  ok &= isWritten(QlxLogWarn(logger, bundle, "slow", u"/home", (int32_t)1250, 12.5));
  ok &= isWritten(QlxLogWarn(logger, bundle, "slow", u"/home", (int32_t)1130, 0.25));
  ok &= isWritten(QlxLogWarn(logger, bundle, "full", u"/backup", 0.97));
  ok &= isWritten(QlxLogUText(logger, u"{0}", u"copy: /home/{1}.txt: Broken pipe (32)"));
  return ok & logJobError(logger, "job-7", bundle, "failed", u"/home", u"Broken pipe");
}

int main(int argc, char **argv) {
  if (argc != 3) {
    fprintf(stderr, "usage: incident CONFIG BUNDLE\n");
    return 2;
  }
  if (!QlxOpenToolkit(argv[1], NULL)) {
    fprintf(stderr, "incident: %s cannot be used\n", argv[1]);
    return 1;
  }
  QlxObject *logger = QlxGetObject("incident.logger", NULL);
  int ok = logBackup(logger, argv[2]);
  QlxReleaseObject(logger);
  QlxCloseToolkit();
  return ok ? 0 : 1;
}
