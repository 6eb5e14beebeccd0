// A test with a handler that writes files, "file", behind the logger: it writes "app.log" in the
// test's own folder, through the plain formatter.
#ifndef QLX_TESTS_FILEHANDLERFIXTURE_H
#define QLX_TESTS_FILEHANDLERFIXTURE_H

#include <string>

#include <qlx/class/handler.h>

#include "QlxFileHandler.h"
#include "support/ChainTest.h"
#include "support/Status.h"
#include "support/TempDir.h"

class FileHandlerFixture : public HandledChainTest {
 protected:
  explicit FileHandlerFixture(const char *className) : HandledChainTest("file", className) {}

  void SetUp() override {
    HandledChainTest::SetUp();
    ASSERT_NE(vars(), nullptr);
    format(handler);
    set("fileName", dir.path("app.log"));
  }

  QlxFileHandlerVars *vars() { return static_cast<QlxFileHandlerVars *>(handler->vars); }

  void set(const char *key, const std::string &value) {
    EXPECT_EQ(QlxSetObjProp(handler.get(), key, value.c_str()), 1);
  }

  // Tells the handler of a key that has no value.
  void changeAbsent(const char *key) { clear(handler, key); }

  // Has another handler record what this one passes on.
  void forward() {
    const Handle next = get("recording", RecordingHandler::kClass);
    QlxAddListener(handler.get(), next.get());
  }

  // The status that a log call gave back.
  CxStatus logged(const char16_t *text) {
    const QlxLogResult result = log(text);
    return {result.statusKind, result.statusCode};
  }

  // What could not be done so far.
  static QlxHandlerProblems problems() {
    QlxHandlerProblems problems;
    qlxIntlGetHandlerProblems(&problems);
    return problems;
  }

  // The generations of "app.log", "-" for a missing one, joined with blanks; line feeds show as
  // "|".
  std::string generations() {
    std::string all;
    for (const char *name : {"app.log", "app1.log", "app2.log", "app3.log"}) {
      all += (dir.has(name) ? dir.read(name) : "-") + " ";
    }
    all.pop_back();
    for (char &c : all) c = c == '\n' ? '|' : c;
    return all;
  }

  TempDir dir;
};

#endif
