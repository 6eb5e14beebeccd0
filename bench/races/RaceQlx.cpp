#include <qlx/qlx.h>

#include <stdlib.h>
#include <sys/sem.h>
#include <unistd.h>

#include <string>

#if __has_include(<qlx/macros.h>)
#include <qlx/macros.h>
#endif

#include "Race.h"

namespace {

constexpr const char *kFile = "RaceQlx.cpp";

class QlxRacer : public race::Racer {
 public:
  static std::string version() { return "Qlx " QLX_RACE_VERSION; }
  static bool takesPart([[maybe_unused]] const race::Row &row) {
#ifdef QLX_DEBUG_MAX
    return true;
#else
    return row.call != race::Call::SuppressedInline;
#endif
  }

  static race::Shape shape(const race::Row &row) {
    const std::string time = "####-##-## ##:##:##.###+##:##", file = kFile;
    switch (row.layout) {
      case race::Layout::Line:
        return race::lineShape(row, kFile);
      case race::Layout::Xml:
        return {
            "<Trace Level=\"MIN\">\n <Time Millis=\"{number}\">" + time + "</Time>\n" +
                (row.stamped ? " <Server Format=\"IP\">{word}</Server>\n" : "") +
                " <LogText><![CDATA[{text}]]></LogText>\n <Source FileName=\"" + file +
                "\" Method=\"text\" Line=\"{number}\"/>\n" +
                (row.stamped ? " <Thread>{number}</Thread>\n <Process>{number}</Process>\n" : "") +
                "</Trace>\n",
            ""};
      case race::Layout::Trace:
        return {"\x1e[" + time + "] -  MIN  - " +
                    (row.stamped ? "{word} - p{number}:t{number}" : " - ") + " - " + file +
                    ":text({number}) -  - {text}\n",
                ""};
    }
    abort();
  }

  explicit QlxRacer(const race::Setup &setup) : shared_(setup.shared) {
    // The processes of one run share their parent, and no other run has the same.
    semaphore_ = shared_ ? getppid() : 0;
    QlxOpenToolkit(nullptr, nullptr);
    configureFormatter(setup);
    set("raceFile", "className", shared_ ? "qlx_multiproc_filehandler" : "qlx_filehandler");
    set("raceFile", "fileName", setup.path);
    set("raceFile", "maxFileBytes", std::to_string(setup.maxBytes));
    set("raceFile", "maxFiles", std::to_string(setup.files));
    set("raceFile", "MPFileSemKey", std::to_string(semaphore_));
    set("raceFile", "formatterName", "raceFormatter");
    set("race", "className", setup.stamped ? "qlx_pdlogger" : "qlx_basiclogger");
    set("race", "listenerNames", "raceFile");
    logger_ = QlxGetObject("race", nullptr);
    if (!logger_) abort();
  }
  ~QlxRacer() {
    QlxReleaseObject(logger_);
    QlxCloseToolkit();
  }

  // The semaphore outlives the processes that use it.
  static void removeSemaphore(int32_t key) {
    const int id = semget(key, 0, 0);
    if (id >= 0) semctl(id, 0, IPC_RMID);
  }

  void suppressed() {
    QlxLogDebugMax(logger_, kFile, __func__, __LINE__, kText);
  }
  void suppressedInline() {
#ifdef QLX_DEBUG_MAX
    QLX_DEBUG_MAX(logger_, kText);
#endif
  }
  void text() {
    check(QlxLogDebugMin(logger_, kFile, __func__, __LINE__, kText));
  }
  void message() {
    check(QlxLogUText(logger_, u"user {0} moved {1,number,integer} items at {2,number} a second",
                      u"alice", 12345, 2.75));
  }
  void localized() {
    check(QlxLogInfo(logger_, QLX_BENCH_BUNDLE, "transfer", u"alice", 12345, 2.75));
  }

 private:
  static constexpr const UChar kText[] = u"" RACE_TEXT;

  static void check(QlxLogResult result) {
    if (result.statusKind != '-') abort();
  }

  static void set(const char *name, const char *key, const std::string &value) {
    ObjCfg *cfg = QlxLogMgrGetCfg(name);
    QlxSetObjCfgProp(cfg, key, value.c_str());
    QlxReleaseObjCfg(cfg);
  }

  // The lines have the date as the others write it; XML and traces have the one of their own.
  static void configureFormatter(const race::Setup &setup) {
    static constexpr const char *kClasses[] = {"qlx_basicformatter", "qlx_xmlformatter",
                                               "qlx_vextraceformatter"};
    set("raceFormatter", "className", kClasses[static_cast<int>(setup.layout)]);
    if (setup.layout != race::Layout::Line) return;
    set("raceFormatter", "dateTimeFormat", "yyyy-MM-dd HH:mm:ss.SSS");
  }

  const bool shared_;
  int32_t semaphore_ = 0;
  QlxObject *logger_ = nullptr;
};

}  // namespace

int main(int argc, char **argv) {
  const int result = race::run(
      argc, argv,
      {"qlx", QlxRacer::version, QlxRacer::takesPart, QlxRacer::shape, race::withLogger<QlxRacer>});
  QlxRacer::removeSemaphore(getpid());
  return result;
}
