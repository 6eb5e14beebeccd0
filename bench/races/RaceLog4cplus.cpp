// log4cplus: its rolling file appender, flushed after every record, and with its lock file when
// processes share the file.
#include <log4cplus/fileappender.h>
#include <log4cplus/helpers/property.h>
#include <log4cplus/initializer.h>
#include <log4cplus/layout.h>
#include <log4cplus/logger.h>
#include <log4cplus/loggingmacros.h>
#include <log4cplus/version.h>

#include <memory>
#include <string>

#include "Race.h"

// The function's name alone, as the others have it, in place of its whole signature.
#undef LOG4CPLUS_MACRO_FUNCTION
#define LOG4CPLUS_MACRO_FUNCTION() __func__

namespace {

class Log4cplusRacer : public race::Racer {
 public:
  static std::string version() { return std::string("log4cplus ") + LOG4CPLUS_VERSION_STR; }
  static bool takesPart(const race::Row &row) { return !race::isOwnRow(row); }
  static race::Shape shape(const race::Row &row) {
    return race::lineShape(row, "RaceLog4cplus.cpp");
  }

  explicit Log4cplusRacer(const race::Setup &setup)
      : logger_(log4cplus::Logger::getInstance("race")) {
    log4cplus::helpers::Properties properties;
    properties.setProperty("File", setup.path);
    properties.setProperty("MaxFileSize", std::to_string(setup.maxBytes));
    properties.setProperty("MaxBackupIndex", std::to_string(setup.files - 1));
    properties.setProperty("ImmediateFlush", "true");
    properties.setProperty("Append", "true");
    properties.setProperty("UseLockFile", setup.shared ? "true" : "false");
    log4cplus::SharedAppenderPtr appender(new log4cplus::RollingFileAppender(properties));
    appender->setLayout(std::make_unique<log4cplus::PatternLayout>(
        setup.source ? "%D{%Y-%m-%d %H:%M:%S.%q} %b %M %L %m%n" : "%D{%Y-%m-%d %H:%M:%S.%q} %m%n"));
    logger_.addAppender(appender);
    logger_.setAdditivity(false);
    logger_.setLogLevel(log4cplus::DEBUG_LOG_LEVEL);
  }

  void suppressed() { LOG4CPLUS_TRACE_STR(logger_, race::kText); }
  void text() { LOG4CPLUS_DEBUG_STR(logger_, race::kText); }
  void message() {
    LOG4CPLUS_DEBUG_FMT(logger_, "user %s moved %d items at %g a second", "alice", 12345, 2.75);
  }

 private:
  log4cplus::Initializer initializer_;
  log4cplus::Logger logger_;
};

}  // namespace

RACE_MAIN(Log4cplusRacer, "log4cplus")
