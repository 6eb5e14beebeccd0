/* A small host in C: one message of a resource bundle, with two parameters. */
#include <stdio.h>

#include <qlx/qlx.h>

int main(int argc, char **argv) {
  CxStatus status = {'-', 0};
  if (argc != 3) {
    fprintf(stderr, "usage: hello CONFIG BUNDLE\n");
    return 2;
  }
  if (!QlxOpenToolkit(argv[1], &status)) {
    fprintf(stderr, "hello: %s cannot be used (error %d)\n", argv[1], (int)status.code);
    return 1;
  }
  QlxObject *logger = QlxGetObject("hello.logger", NULL);
  QlxLogResult result = QlxLogInfo(logger, argv[2], "copied", u"backup", (int32_t)1250);
  QlxReleaseObject(logger);
  QlxCloseToolkit();
  return result.statusKind == '-' && result.msgStatus <= 0 ? 0 : 1;
}
