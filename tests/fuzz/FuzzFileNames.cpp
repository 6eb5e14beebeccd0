// Any bytes as the name of a log file: taken apart and put together again they give the same name,
// and each generation has a name of its own.
#include <cstdlib>
#include <string>
#include <string_view>

#include <qlx/memory.h>

#include "file/QlxFileNames.h"
#include "support/Take.h"

static void require(bool holds) {
  if (!holds) std::abort();
}

static std::string_view text(const char *part) {
  return part ? part : "";
}

static std::string generationName(const QlxLogNames &names, int32_t generation) {
  return take(qlxFHGenerationName(&names, generation));
}

// What follows the base must be the number and the extension.
static void checkRest(std::string_view rest, const QlxLogNames &names) {
  const size_t digits = std::min(rest.find_first_not_of("0123456789"), rest.size());
  if (names.generation != 0) require(digits > 0);
  rest.remove_prefix(digits);
  require(names.extPart ? rest == "." + std::string(names.extPart) : rest.empty());
}

static void checkParts(const std::string &name) {
  QlxLogNames names = {};
  qlxFHGetFileNameParts(name.c_str(), &names);
  require((names.basePart != nullptr) == (name.size() <= 256));
  if (names.basePart) {
    char native[257];
    qlxGetNativePath(name.c_str(), native);
    std::string_view rest = native;
    const std::string_view base = names.basePart;
    // A directory that is not in the name is the working directory.
    const std::string_view dir = text(names.dirPart);
    const std::string inName = std::string(dir) + std::string(base);
    rest.remove_prefix(rest.starts_with(inName) ? inName.size() : base.size());
    require(base.empty() || base.back() < '0' || base.back() > '9');
    checkRest(rest, names);
    const std::string all[] = {generationName(names, 0), generationName(names, 1),
                               generationName(names, 10)};
    require(all[0] != all[1] && all[1] != all[2] && all[0] != all[2]);
  }
  for (char *part : {names.dirPart, names.basePart, names.extPart}) OslMemoryFree(part);
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::string name{std::string(reinterpret_cast<const char *>(data), size).c_str()};
  const int32_t digit = qlxFHTrailingBaseDigit(name.c_str());
  require(digit >= -1 && digit < static_cast<int32_t>(name.size()));
  const std::string closed = take(qlxFHCloseBaseDigits(name.c_str()));
  require(closed.size() == name.size() + (digit < 0 ? 0 : 1));
  require(qlxFHTrailingBaseDigit(closed.c_str()) == -1);
  checkParts(name);
  checkParts(closed);
  return 0;
}
