#include "support/ToolkitLifeTest.h"

#include <cstdlib>
#include <unistd.h>

#include "support/FailingMemory.h"
#include "support/FreshProcess.h"
#include "support/InertHandle.h"

namespace {

TEST_F(ToolkitLifeTest, AHeldHandleIsInertAfterACloseAndAfterANewOpen) {
  open();
  std::vector<Handle> handles;
  for (const char *name :
       {"qlx_basiclogger", "qlx_levelfilter", "qlx_consolehandler", "qlx_basicformatter"}) {
    handles.push_back(get(name, name));
    QlxSetObjProp(handles.back().get(), "key", "value");
  }
  QlxAddListener(handles[0].get(), handles[2].get());
  QlxCloseToolkit();
  for (const Handle &handle : handles) expectInert(handle.get());
  open();
  for (const Handle &handle : handles) expectInert(handle.get());
  const Handle anew = get("qlx_basiclogger", "qlx_basiclogger");
  EXPECT_NE(anew, handles[0]);
  EXPECT_EQ(QlxAddListener(anew.get(), handles[2].get()), 0);
  EXPECT_EQ(QlxRemListener(anew.get(), handles[2].get()), 0);
  const Handle console = find("quill.defaultConsole"), formatter = find("quill.defaultFormatter");
  QlxHandlerSetFormatter(console.get(), handles[3].get());
  EXPECT_EQ(console->kind2.formatter, formatter.get());
}

TEST_F(ToolkitLifeTest, TheHeaderGoesWithTheHostsLastRelease) {
  open();
  QlxCloseToolkit();
  const FailingMemory memory;
  open();
  Handle handle = get("a", "qlx_basiclogger");
  Handle second{QlxAcquireObject(handle.get())};
  QlxCloseToolkit();
  EXPECT_EQ(memory.live(), 1);
  EXPECT_EQ(handle->refCount, 2u);
  handle.reset();
  EXPECT_EQ(memory.live(), 1);
  second.reset();
  EXPECT_EQ(memory.live(), 0);
}

// ---- The end of a process

QlxObject *gLogger;
HostClasses *gHost;

void logAtExit() {
  QlxLogUText(gLogger, u"text");
  if (gHost->count("log l") != 1) _exit(1);
}
void logAtExitClosed() {
  QlxLogUText(gLogger, u"text");
  if (gHost->count("log l") != 0) _exit(1);
  QlxReleaseObject(gLogger);
  QlxCloseToolkit();
}

struct LogsWhenItGoes {
  ~LogsWhenItGoes() { logAtExit(); }
};

TEST(ToolkitExitTest, AnAtexitHandlerMayLogWhileTheToolkitIsOpen) {
  inFreshProcess([] {
    QlxOpenToolkit(nullptr, nullptr);
    gHost = new HostClasses;
    gLogger = QlxGetObject("l", HostClasses::kLogger);
    std::atexit(logAtExit);
  });
}

TEST(ToolkitExitTest, AnAtexitHandlerMayUseAHandleAfterTheToolkitWasClosed) {
  inFreshProcess([] {
    std::atexit(logAtExitClosed);
    QlxOpenToolkit(nullptr, nullptr);
    gHost = new HostClasses;
    gLogger = QlxGetObject("l", HostClasses::kLogger);
    QlxCloseToolkit();
  });
}

TEST(ToolkitExitTest, AStaticDestructorMayLog) {
  inFreshProcess([] {
    static const LogsWhenItGoes logs;
    QlxOpenToolkit(nullptr, nullptr);
    gHost = new HostClasses;
    gLogger = QlxGetObject("l", HostClasses::kLogger);
  });
}

}  // namespace
