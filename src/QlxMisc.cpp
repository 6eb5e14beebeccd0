// Small utilities beside the toolkit: joining strings, and platform statuses as text. No lock.
#include <string.h>

#include <qlx/memory.h>
#include <qlx/toolkit.h>

#include "util/CxOwned.h"

static constexpr size_t kMaxErrorTextChars = 256;

namespace {

struct Joiner {
  const char *separator;
  size_t separatorLength;
  char *out;  // null: only measure
  size_t length = 0;
  bool first = true;

  void add(const char *text) {
    if (!first) put(separator, separatorLength);
    put(text, strlen(text));
    first = false;
  }

  void put(const char *text, size_t count) {
    if (out && count > 0) memcpy(out + length, text, count);
    length += count;
  }
};

}  // namespace

char *QlxStrACat(int32_t count, const char *const *strings, const char *separator) {
  const size_t separatorLength = OslStringLen(separator);
  const auto join = [&](char *out) {
    Joiner joiner{separator, separatorLength, out};
    for (int32_t i = 0; strings && i < count; ++i) {
      if (strings[i]) joiner.add(strings[i]);
    }
    return joiner.length;
  };

  const size_t length = join(nullptr);
  if (length >= UINT32_MAX) return nullptr;
  char *joined = static_cast<char *>(OslMemoryMalloc(static_cast<uint32_t>(length + 1)));
  if (!joined) return nullptr;
  join(joined);
  joined[length] = '\0';
  return joined;
}

char *QlxGetPlatformErrStr(CxStatus status) {
  if (status.kind != 'p') return nullptr;
  char text[kMaxErrorTextChars];
  return OslStringDup(strerror_r(status.code, text, sizeof text));
}

void QlxReportPlatformErr(CxStatus status) {
  // Deliberate: the text is looked up and dropped; reporting is silent.
  const OwnedStr text{QlxGetPlatformErrStr(status)};
}
