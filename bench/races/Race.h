// What the races share. Each logger has one small program, which runs one row once:
//
//   race_spdlog text FOLDER [SCALE]   prints: spdlog, text, ns a record, records, lost, malformed
//   race_spdlog --version             prints: spdlog 1.10.0
//   race_spdlog --rows                prints the rows that it takes part in
//
// A program is a class with these members, and RACE_MAIN of it:
//
//   static std::string version();
//   static bool takesPart(const Row &row);
//   static Shape shape(const Row &row);   the record that each call of the row must leave
//   explicit Racer(const Setup &setup);   opens the logger
//   void suppressed(), text(), message(), suppressedInline(), localized();
//
// Every record has to be with the operating system before its call returns. A run fails when one
// of a few first records is not, and it reads all files again: each record has to have the shape,
// and what is missing counts as lost.
#ifndef QLX_BENCH_RACE_H
#define QLX_BENCH_RACE_H

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace race {

#define RACE_TEXT                                                                                \
  "a text of one hundred bytes, as long as a line of a common log tends to be in practice, and " \
  "not more"
constexpr const char kText[] = RACE_TEXT;
static_assert(sizeof kText == 100 + 1);
constexpr const char kMessage[] = "user alice moved 12345 items at 2.75 a second";

enum class Call { Suppressed, SuppressedInline, Text, Message, Localized };
enum class Layout { Line, Xml, Trace };

struct Row {
  std::string_view name;
  Call call;
  int64_t records;    // of all threads or processes together, at scale 1
  int threads = 1;    // more than one: one logger for all
  int processes = 1;  // more than one: each has a logger of its own, on the same file
  int64_t maxBytes = 1'000'000'000;
  int files = 3;  // generations, the active one among them
  Layout layout = Layout::Line;
  bool stamped = false;  // with host, process and thread
  int64_t least = 8;     // records at any scale
};

// What a logger is opened with.
struct Setup {
  std::string folder;  // exists, empty
  std::string path;    // of the active file
  int64_t maxBytes;
  int files;
  bool source;  // a record has file, function and line between date and text
  bool shared;  // other processes write to the file
  Layout layout;
  bool stamped;
};

// How a record looks: literal text, but # is a digit, {number} some digits (padded by blanks),
// {word} some characters up to a blank, '<' or '(', {text} the text of the row's call. Records
// follow one another.
struct Shape {
  std::string record;
  std::string lastOfHeader;  // a file's first lines, up to the one that starts so, are no records
};

// For racers to derive from: the calls that only some have.
struct Racer {
  void suppressedInline() {}
  void localized() {}
  void message() {}
};

// Makes so many calls.
using Log = std::function<void(int64_t)>;

// What one racer does, without its type.
struct Field {
  const char *name;
  std::string (*version)();
  bool (*takesPart)(const Row &);
  Shape (*shape)(const Row &);
  // Opens a logger, gives it to `inside` as a function that makes so many calls, and closes it.
  void (*withLogger)(const Setup &, Call, const std::function<void(const Log &)> &inside);
  bool rolls = true;  // keeps to the limits of size and number
};

int run(int argc, char **argv, const Field &field);

// The call stands in the loop itself; the barrier makes each one read its logger again.
template <auto Method, typename R>
Log loopOf(R &racer) {
  return [&racer](int64_t count) {
    for (int64_t i = 0; i < count; i++) {
      (racer.*Method)();
      asm volatile("" ::: "memory");
    }
  };
}

template <typename R>
void withLogger(const Setup &setup, Call call, const std::function<void(const Log &)> &inside) {
  R racer{setup};
  switch (call) {
    case Call::Suppressed:
      return inside(loopOf<&R::suppressed>(racer));
    case Call::SuppressedInline:
      return inside(loopOf<&R::suppressedInline>(racer));
    case Call::Text:
      return inside(loopOf<&R::text>(racer));
    case Call::Message:
      return inside(loopOf<&R::message>(racer));
    case Call::Localized:
      return inside(loopOf<&R::localized>(racer));
  }
}

// Date and what follows it, as most of the racers write it.
inline Shape lineShape(const Row &row, const char *file) {
  const bool source = row.call == Call::Text;
  return {"####-##-## ##:##:##.### " + (source ? std::string(file) + " text {number} " : "") +
              "{text}\n",
          ""};
}

// A row that only Qlx has.
inline bool isOwnRow(const Row &row) {
  return row.call == Call::SuppressedInline || row.call == Call::Localized ||
         row.layout != Layout::Line;
}

}  // namespace race

#define RACE_MAIN(Class, name)                                                            \
  int main(int argc, char **argv) {                                                       \
    return race::run(                                                                     \
        argc, argv,                                                                       \
        {name, Class::version, Class::takesPart, Class::shape, race::withLogger<Class>}); \
  }

#endif
