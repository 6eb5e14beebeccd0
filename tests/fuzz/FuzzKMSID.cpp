// Any bytes as the text of a message: what is recognised stands at its start, has the length and
// the numbers of its layout, and depends on nothing behind the tenth character.
#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <string>

#include <qlx/class/msgid.h>
#include <qlx/kmsid.h>

#include "support/Take.h"

static void require(bool holds) {
  if (!holds) std::abort();
}

static bool same(const CxKMSIDInfo &a, const CxKMSIDInfo &b) {
  return std::strcmp(a.version, b.version) == 0 && a.number == b.number && a.length == b.length &&
         std::memcmp(a.id, b.id, sizeof a.id) == 0 && a.severity == b.severity;
}

static void checkNothing(const CxKMSIDInfo &info) {
  require(*info.version == 0 && info.number == 0 && info.severity == 0);
  require(std::count(info.id, info.id + sizeof info.id, '\0') == sizeof info.id);
}

// The layout's number has the letters and the digits of the identifier in it, and a 1.
static void checkIdentifier(const CxKMSIDInfo &info, const std::string &text) {
  require(info.length >= 7 && info.length <= 10);
  const std::string id = text.substr(0, static_cast<size_t>(info.length));
  require(std::memcmp(info.id, id.data(), id.size()) == 0);
  const size_t letters = id.find_first_of("0123456789");
  const auto digits = id.size() - letters - 1;
  require(info.number == static_cast<int32_t>(letters * 100 + digits * 10 + 1));
  require(id.size() == 10 ? info.severity == 0 : info.severity == id.back());
  require(std::strchr("IWE", id.back()) != nullptr);
  require(same(info, CxParseKMSID(id.c_str())));
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::string text = std::string(reinterpret_cast<const char *>(data), size).c_str();
  const CxKMSIDInfo info = CxParseKMSID(text.c_str());
  require(same(info, CxParseKMSID(text.substr(0, 10).c_str())));
  if (info.length == 0)
    checkNothing(info);
  else
    checkIdentifier(info, text);

  const std::string id = info.length ? text.substr(0, static_cast<size_t>(info.length)) : "<null>";
  require(take(qlxPDXMLGetMessageID(text.c_str())) == id);
  std::u16string wide;
  for (const char c : text) wide += static_cast<unsigned char>(c);
  require(take(qlxPDXMLUGetMessageID(wide.c_str())) == id);
  return 0;
}
