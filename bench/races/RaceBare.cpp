// The floor: a record that stands ready, written to an append-mode file. A suppressed call is an
// out-of-line call that does nothing. It never rolls.
#include <fcntl.h>
#include <stdlib.h>
#include <unistd.h>

#include <string>

#include "Race.h"

namespace {

[[gnu::noinline]] void nothing() {
  asm volatile("");
}

class BareRacer : public race::Racer {
 public:
  static std::string version() { return "bare write"; }
  static bool takesPart(const race::Row &row) {
    return !race::isOwnRow(row) && row.name != "rolling";
  }
  static race::Shape shape(const race::Row &row) { return race::lineShape(row, "RaceBare.cpp"); }

  explicit BareRacer(const race::Setup &setup)
      : record_(std::string("2026-02-03 04:05:06.789 ") +
                (setup.source ? "RaceBare.cpp text 42 " : "") +
                (setup.source ? race::kText : race::kMessage) + "\n"),
        file_(open(setup.path.c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0600)) {}
  ~BareRacer() { close(file_); }

  void suppressed() { nothing(); }
  void text() {
    if (write(file_, record_.data(), record_.size()) < 0) abort();
  }
  void message() { text(); }

 private:
  const std::string record_;
  const int file_;
};

}  // namespace

int main(int argc, char **argv) {
  return race::run(argc, argv,
                   {"bare", BareRacer::version, BareRacer::takesPart, BareRacer::shape,
                    race::withLogger<BareRacer>, false});
}
