// A small host in C++: the same messages in three languages, chosen while the program runs, on the
// console and in a file.
#include <cstdio>
#include <initializer_list>
#include <memory>

#include <qlx/qlx.h>

namespace {
struct Release {
  void operator()(QlxObject *object) const { QlxReleaseObject(object); }
};
using ObjectRef = std::unique_ptr<QlxObject, Release>;

ObjectRef getObject(const char *name) {
  return ObjectRef(QlxGetObject(name, nullptr));
}
}  // namespace

// Parameters are read as the message's pattern has them: UTF-16 text, int32_t, double.
static bool logInAllLanguages(const char *bundle) {
  const ObjectRef logger = getObject("localized.logger");
  const ObjectRef formatter = getObject("localized.formatter");
  bool ok = true;
  for (const char *locale : {"root", "de", "ja"}) {
    QlxSetObjProp(formatter.get(), "locale", locale);
    for (const QlxLogResult result :
         {QlxLogInfo(logger.get(), bundle, "copied", u"backup", int32_t{1250}),
          QlxLogWarn(logger.get(), bundle, "filling", u"/var", 0.93),
          QlxLogError(logger.get(), bundle, "lost", u"db1")}) {
      ok = ok && result.statusKind == '-' && result.msgStatus <= 0;
    }
  }
  return ok;
}

int main(int argc, char **argv) {
  if (argc != 3) {
    fprintf(stderr, "usage: localized CONFIG BUNDLE\n");
    return 2;
  }
  if (!QlxOpenToolkit(argv[1], nullptr)) {
    fprintf(stderr, "localized: %s cannot be used\n", argv[1]);
    return 1;
  }
  const bool ok = logInAllLanguages(argv[2]);
  QlxCloseToolkit();
  return ok ? 0 : 1;
}
