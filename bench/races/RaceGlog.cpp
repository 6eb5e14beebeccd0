// glog, flushed after every record. It takes no part in rolling and in the row of the processes: it
// keeps no number of files, and a file of its own for each process. Its own prefix has date,
// thread, file and line (which cannot be left out), so the function stands in the text.
#include <glog/logging.h>

#include <string>

#include "Race.h"

namespace {

class GlogRacer : public race::Racer {
 public:
  static std::string version() { return "glog " RACE_PEER_VERSION; }
  static bool takesPart(const race::Row &row) {
    return !race::isOwnRow(row) && row.name != "rolling" && row.processes == 1;
  }
  static race::Shape shape(const race::Row &row) {
    return {std::string("I######## ##:##:##.###### {number} RaceGlog.cpp:{number}] ") +
                (row.call == race::Call::Text ? "text " : "") + "{text}\n",
            "Log line format:"};
  }

  explicit GlogRacer(const race::Setup &setup) {
    FLAGS_log_dir = setup.folder;
    FLAGS_max_log_size = static_cast<google::uint32>(setup.maxBytes / 1'000'000);
    FLAGS_logbuflevel = -1;
    FLAGS_logbufsecs = 0;
    FLAGS_stderrthreshold = google::NUM_SEVERITIES;
    FLAGS_v = 0;
    google::InitGoogleLogging("race");
  }
  ~GlogRacer() { google::ShutdownGoogleLogging(); }

  void suppressed() { VLOG(1) << race::kText; }
  void text() { LOG(INFO) << __func__ << ' ' << race::kText; }
  void message() {
    LOG(INFO) << "user "
              << "alice"
              << " moved " << 12345 << " items at " << 2.75 << " a second";
  }
};

}  // namespace

RACE_MAIN(GlogRacer, "glog")
