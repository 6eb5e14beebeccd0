// log4cxx: its rolling file appender, unbuffered and flushed after every record.
#include <log4cxx/logger.h>
#include <log4cxx/logmanager.h>
#include <log4cxx/patternlayout.h>
#include <log4cxx/rolling/fixedwindowrollingpolicy.h>
#include <log4cxx/rolling/rollingfileappender.h>
#include <log4cxx/rolling/sizebasedtriggeringpolicy.h>

#include <memory>
#include <string>

#include "Race.h"

namespace {

class Log4cxxRacer : public race::Racer {
 public:
  static std::string version() { return "log4cxx " RACE_PEER_VERSION; }
  static bool takesPart(const race::Row &row) { return !race::isOwnRow(row); }
  static race::Shape shape(const race::Row &row) { return race::lineShape(row, "RaceLog4cxx.cpp"); }

  explicit Log4cxxRacer(const race::Setup &setup) {
    const auto policy = std::make_shared<log4cxx::rolling::FixedWindowRollingPolicy>();
    policy->setMinIndex(1);
    policy->setMaxIndex(setup.files - 1);
    policy->setFileNamePattern(setup.folder + "/race%i.log");
    const auto trigger = std::make_shared<log4cxx::rolling::SizeBasedTriggeringPolicy>();
    trigger->setMaxFileSize(setup.maxBytes);

    const auto appender = std::make_shared<log4cxx::rolling::RollingFileAppender>();
    appender->setLayout(std::make_shared<log4cxx::PatternLayout>(
        setup.source ? "%d{yyyy-MM-dd HH:mm:ss.SSS} %f %M %L %m%n"
                     : "%d{yyyy-MM-dd HH:mm:ss.SSS} %m%n"));
    appender->setFile(setup.path);
    appender->setAppend(true);
    appender->setBufferedIO(false);
    appender->setImmediateFlush(true);
    appender->setRollingPolicy(policy);
    appender->setTriggeringPolicy(trigger);
    log4cxx::helpers::Pool pool;
    appender->activateOptions(pool);
    logger_->setAdditivity(false);
    logger_->addAppender(appender);
    logger_->setLevel(log4cxx::Level::getDebug());
  }
  ~Log4cxxRacer() { log4cxx::LogManager::shutdown(); }

  void suppressed() { LOG4CXX_TRACE(logger_, race::kText); }
  void text() { LOG4CXX_DEBUG(logger_, race::kText); }
  void message() {
    LOG4CXX_DEBUG(logger_, "user "
                               << "alice"
                               << " moved " << 12345 << " items at " << 2.75 << " a second");
  }

 private:
  const log4cxx::LoggerPtr logger_ = log4cxx::Logger::getLogger("race");
};

}  // namespace

RACE_MAIN(Log4cxxRacer, "log4cxx")
