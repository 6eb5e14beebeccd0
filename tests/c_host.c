/*
 * A whole host in C, linked to libqlx.so as any: it opens, makes a chain of its own, logs, reads
 * what was written, closes, and uses its handles once more.
 */
#define _XOPEN_SOURCE 700 /* mkdtemp() */

#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>

#include <qlx/qlx.h>

static int failures;

static void check(int holds, const char *what) {
  if (holds) return;
  fprintf(stderr, "c_host: not so: %s\n", what);
  ++failures;
}
#define CHECK(condition) check((condition) != 0, #condition)

static QlxObject *makeFileHandler(const char *path) {
  QlxObject *formatter = QlxGetObject("c.formatter", "qlx_basicformatter");
  QlxObject *handler = QlxGetObject("c.file", "qlx_filehandler");
  CHECK(QlxSetObjProp(formatter, "dateTimeFormat", "'c'") == 1);
  CHECK(QlxSetObjProp(handler, "fileName", path) == 1);
  QlxHandlerSetFormatter(handler, formatter);
  QlxReleaseObject(formatter);
  return handler;
}

static void logSomething(QlxObject *logger) {
  const QlxLogResult logged =
      QlxLogDebugMin(logger, "main.c", "run", 42, u"{0} of {1,number,integer}", u"one", (int32_t)2);
  const QlxLogResult suppressed = QlxLogDebugMax(logger, NULL, NULL, 0, u"not seen");
  CHECK(logged.statusKind == '-' && logged.statusCode == 0 && logged.msgStatus <= 0);
  CHECK(suppressed.statusKind == '-');
  CHECK(QlxIsLoggable(logger, INFO) == 1);
  CHECK(QlxIsLoggable(logger, DEBUG_MAX) == 0);
}

static int evaluated;
static const UChar *evaluatedText(void) {
  ++evaluated;
  return u"{0}";
}
static const char *evaluatedName(void) {
  ++evaluated;
  return "name";
}

/* Each of the macros, with all but the logger counted. */
static void logInPlace(QlxObject *logger) {
  QLX_DEBUG_MIN(logger, evaluatedText(), evaluatedText());
  QLX_DEBUG_MID(logger, evaluatedText(), evaluatedText());
  QLX_DEBUG_MAX(logger, evaluatedText(), evaluatedText());
  QLX_INFO(logger, evaluatedName(), evaluatedName());
  QLX_WARN(logger, evaluatedName(), evaluatedName());
  QLX_ERROR(logger, evaluatedName(), evaluatedName());
  QLX_FATAL(logger, evaluatedName(), evaluatedName());
}

static void checkMacros(void) {
  QlxObject *silent = QlxGetObject("c.silent", "qlx_basiclogger");
  QlxSetObjectEnabled(silent, 0);
  logInPlace(silent);
  logInPlace(NULL);
  CHECK(evaluated == 0);
  QlxSetObjectEnabled(silent, 1);
  CHECK(QlxSetObjProp(silent, "level", "DEBUG_MAX") == 1);
  logInPlace(silent);
  CHECK(evaluated == 7 * 2);
  if (evaluated == 0)
    QLX_INFO(silent, "bundle", "key");
  else
    evaluated = 0;
  CHECK(evaluated == 0);
  QlxReleaseObject(silent);
}

static void checkFile(const char *path) {
  char text[256] = "";
  FILE *file = fopen(path, "r");
  CHECK(file != NULL);
  if (!file) return;
  text[fread(text, 1, sizeof text - 1, file)] = '\0';
  fclose(file);
  CHECK(strcmp(text, "c main.c run 42 one of 2\n") == 0);
}

int main(void) {
  char folder[] = "/tmp/qlxchostXXXXXX", path[64];
  CxStatus status = {'-', 0};
  CHECK(mkdtemp(folder) != NULL);
  snprintf(path, sizeof path, "%s/c.log", folder);

  CHECK(QlxOpenToolkit("/nowhere/to/be/found", &status) == 0 && status.kind == 'p');
  CHECK(QlxOpenToolkit(NULL, &status) == 1);
  QlxObject *logger = QlxGetObject("c.logger", "qlx_basiclogger");
  QlxObject *handler = makeFileHandler(path);
  CHECK(QlxAddListener(logger, handler) == 1);
  logSomething(logger);
  checkFile(path);
  checkMacros();
  QlxCloseToolkit();

  /* Both handles are inert now: usable, without effect. */
  CHECK(QlxLogInfo(logger, "bundle", "key").statusKind == '-');
  CHECK(QlxGetObjectName(handler) == NULL);
  QlxReleaseObject(handler);
  QlxReleaseObject(logger);

  CHECK(remove(path) == 0);
  CHECK(rmdir(folder) == 0);
  return failures == 0 ? 0 : 1;
}
