// A host with a handler class of its own, "example_recenthandler": it keeps the latest records to
// itself, and prints them when an event of level ERROR or above comes, as the way that led there.
//
// Operations of a class run with the API lock held. They call only what takes no lock: the
// qlxIntl... functions, the operations of the built-in classes, and what its header says takes no
// lock.
#include <cstdio>
#include <initializer_list>
#include <cstring>
#include <deque>
#include <string>

#include <qlx/qlx.h>

namespace {
struct RecentVars {
  std::deque<std::string> lines;  // the oldest first
  size_t maxLines = 10;           // key "maxLines"
};
}  // namespace

static RecentVars *varsOf(QlxObject *handler) {
  return static_cast<RecentVars *>(handler->vars);
}

static void *allocVars() {
  return new RecentVars;
}

static void freeVars(void *vars) {
  delete static_cast<RecentVars *>(vars);
}

static void cfgChange(QlxObject *handler, const char *key) {
  if (strcmp(key, "maxLines") != 0) return QlxBasicHandlerFCfgChange(handler, key);
  uint8_t found;
  const int32_t value = qlxIntlGetObjPropInt(handler, key, &found);
  if (found && value > 0) varsOf(handler)->maxLines = value;
}

static void printRecent(RecentVars &vars) {
  for (const std::string &line : vars.lines) fputs(line.c_str(), stdout);
  vars.lines.clear();
}

static void keep(RecentVars &vars, const UChar *text) {
  char *line = CxUStringDupUCharToStr(text);
  if (line) vars.lines.push_back(line);
  if (vars.lines.size() > vars.maxLines) vars.lines.pop_front();
  OslMemoryFree(line);
}

static void process(QlxObject *handler, Event *event, va_list *args) {
  if (!qlxIntlIsObjectEnabled(handler)) return;
  UChar *text = qlxIntlUHandlerDoFmt(handler, event, args);
  if (text) keep(*varsOf(handler), text);
  OslMemoryFree(text);
  if (QlxGetEventLevel(event) >= ERROR) printRecent(*varsOf(handler));
  QlxBasicObjectFLog(handler, event, args);  // the handler's own listeners
}

static void closeHandler(QlxObject *handler) {
  printf("records not needed: %zu\n", varsOf(handler)->lines.size());
}

int main(int argc, char **argv) {
  if (argc != 3) {
    fprintf(stderr, "usage: recent CONFIG BUNDLE\n");
    return 2;
  }
  // Before the toolkit opens, so that the configuration can name the class.
  QlxAddHandlerClass("example_recenthandler", nullptr, allocVars, freeVars, cfgChange, process,
                     nullptr, closeHandler);
  if (!QlxOpenToolkit(argv[1], nullptr)) return 1;
  QlxObject *logger = QlxGetObject("recent.logger", nullptr);
  for (const int32_t files : {1, 2, 3, 4}) {
    QLX_INFO(logger, argv[2], "copied", u"backup", files);
  }
  QLX_ERROR(logger, argv[2], "lost", u"db1");
  QLX_INFO(logger, argv[2], "copied", u"backup", int32_t{5});
  QlxReleaseObject(logger);
  QlxCloseToolkit();
  return 0;
}
