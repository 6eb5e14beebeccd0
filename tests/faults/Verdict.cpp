#include "Verdict.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <optional>
#include <string_view>

namespace fs = std::filesystem;

static constexpr const char *kForeignNames[] = {"app01.log",  "app1x.log", "app00.log", "app-1.log",
                                                "app1.log~",  "app.log.1", "App1.log",  "xapp1.log",
                                                "app 1.log",  "app+2.log", "app40.log", "app1.LOG",
                                                "app1.log.x", "app",       "app1",      "1.log"};
static constexpr const char *kLinkTarget = "elsewhere.txt";  // not in the folder

static std::string foreignText(std::string_view name) {
  return "of somebody else: " + std::string(name) + "\n";
}

static std::string readFile(const std::string &path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

static void writeFile(const std::string &path, const std::string &bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}

static std::string generationName(int generation) {
  return "app" + (generation == 0 ? "" : std::to_string(generation)) + ".log";
}

void Verdict::note(uint64_t count, const std::string &what) {
  if (count != 0) wrong += (wrong.empty() ? "" : ", ") + std::to_string(count) + " " + what;
}

// ---- Before the run

void prepareFolder(const Variant &variant, const std::string &root, const std::string &folder) {
  if (variant.freshFolder) return;
  fs::create_directories(folder);
  for (const char *name : kForeignNames) writeFile(folder + "/" + name, foreignText(name));
  writeFile(root + "/" + kLinkTarget, foreignText(kLinkTarget));
  fs::create_symlink("../" + std::string(kLinkTarget), folder + "/" + generationName(1));
  std::string earlier;
  for (uint32_t i = 0; variant.earlier && i < kEarlierRecords; ++i) {
    earlier += textOf({kEarlierSlot, i}) + "\n";
  }
  if (variant.earlier) writeFile(folder + "/" + generationName(0), earlier);
}

// ---- After it

namespace {

class Judge {
 public:
  Judge(const Variant &variant, const std::string &folder, Verdict *verdict)
      : variant_(variant), folder_(folder), verdict_(verdict) {}

  void readGenerations() {
    for (int generation = kMaxFiles - 1; generation >= 0; --generation) {
      const std::string path = folder_ + "/" + generationName(generation);
      if (fs::is_symlink(fs::symlink_status(path))) continue;
      const std::string bytes = readFile(path);
      variant_.form == Form::kXml ? readElements(bytes) : readLines(bytes);
    }
    for (const auto &[id, times] : found_) verdict_->doubled += times > 1;
  }

  void compare(RecordId id) {
    ++verdict_->acknowledged;
    const bool isLost = found_.count(id) == 0;
    (variant_.mayLoseCopies ? verdict_->lostCopies : verdict_->lost) += isLost;
  }

 private:
  static std::optional<RecordId> onlyRecordIn(std::string_view line) {
    Findings inside;
    parseRecords(line, &inside);
    if (inside.fragments != 0 || inside.records.size() != 1 || inside.repeated() != 0) return {};
    return inside.records.begin()->first;
  }

  void take(std::optional<RecordId> id) {
    if (!id) {
      ++verdict_->torn;
      return;
    }
    ++found_[*id];
    const auto last = last_.find(id->first);
    if (last != last_.end() && last->second > id->second) ++verdict_->disordered;
    last_[id->first] = id->second;
  }

  static std::string_view cutPiece(std::string_view *bytes, std::string_view end) {
    const size_t place = bytes->find(end);
    const size_t length = place == bytes->npos ? bytes->size() : place + end.size();
    const std::string_view piece = bytes->substr(0, length);
    bytes->remove_prefix(length);
    return piece;
  }

  void readLines(std::string_view bytes) {
    const bool framed = variant_.form == Form::kFramedLine;
    while (!bytes.empty()) {
      const std::string_view line = cutPiece(&bytes, "\n");
      if (framed && (line == kHeader || line == kTrailer)) continue;
      take(onlyRecordIn(line));
    }
  }

  void readElements(std::string_view bytes) {
    while (!bytes.empty()) {
      const std::string_view element = cutPiece(&bytes, kElementEnd);
      const bool isWhole = element.starts_with(kElementStart) && element.ends_with(kElementEnd) &&
                           element.find(kElementStart, 1) == element.npos;
      take(isWhole ? recordInElement(element) : std::nullopt);
    }
  }

  // The text stands as it is in its element.
  static std::optional<RecordId> recordInElement(std::string_view element) {
    const size_t digit = element.find("[CDATA[<");
    if (digit == element.npos) return {};
    element.remove_prefix(digit + std::string_view("[CDATA[").size());
    return onlyRecordIn(std::string(element.substr(0, element.find('>') + 1)) + "\n");
  }

  const Variant &variant_;
  const std::string &folder_;
  Verdict *const verdict_;
  std::map<RecordId, int> found_;
  std::map<uint32_t, uint32_t> last_;
};

bool isGenerationName(const std::string &name) {
  for (int generation = 0; generation < kMaxFiles; ++generation) {
    if (name == generationName(generation)) return true;
  }
  return false;
}

}  // namespace

static void judgeForeignFiles(const Variant &variant, const std::string &root,
                              const std::string &folder, Verdict *verdict) {
  const auto isForeign = [](const std::string &name) {
    return std::find(std::begin(kForeignNames), std::end(kForeignNames), name) !=
           std::end(kForeignNames);
  };
  std::error_code missing;
  for (const auto &entry : fs::directory_iterator(folder, missing)) {
    const std::string name = entry.path().filename();
    const bool expected = isGenerationName(name) || (!variant.freshFolder && isForeign(name));
    verdict->note(!expected, "new file " + name);
  }
  if (variant.freshFolder) return;
  for (const char *name : kForeignNames) {
    verdict->note(readFile(folder + "/" + name) != foreignText(name),
                  std::string("foreign file changed: ") + name);
  }
  verdict->note(readFile(root + "/" + kLinkTarget) != foreignText(kLinkTarget),
                "target of a link changed");
}

static void judgeAnswers(const Variant &variant, const Board &board, Judge *judge,
                         Verdict *verdict) {
  for (uint32_t i = 0; variant.earlier && i < kEarlierRecords; ++i) {
    judge->compare({kEarlierSlot, i});
  }
  for (uint32_t slot = 0; slot < variant.writers; ++slot) {
    const WriterBoard &writer = board.writers[slot];
    for (uint32_t number = 0; number < writer.count; ++number) {
      if (writer.answers[number].kind == '-')
        judge->compare({slot, number});
      else if (number >= variant.records)
        ++verdict->refused;
    }
  }
}

void judgeFolder(const Variant &variant, const std::string &root, const std::string &folder,
                 const Board &board, Verdict *verdict) {
  Judge judge(variant, folder, verdict);
  judge.readGenerations();
  judgeAnswers(variant, board, &judge, verdict);
  verdict->note(verdict->lost, "records lost");
  verdict->note(verdict->doubled, "records twice");
  const bool mayTear = variant.cutWhen || variant.mayLoseCopies;  // a copy, too, may be a piece
  if (!mayTear) verdict->note(verdict->torn, "torn pieces");
  verdict->note(verdict->disordered, "out of order");
  verdict->note(verdict->refused, "refused after the faults");
  judgeForeignFiles(variant, root, folder, verdict);
}
