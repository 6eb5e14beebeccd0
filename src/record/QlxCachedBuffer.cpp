#include "QlxCachedBuffer.h"

#include <array>
#include <utility>

#include "util/CxHooks.h"

// A larger one is not cached for all the events after it.
static constexpr uint32_t kMaxCachedBytes = 64 * 1024;

// Those that are not in use: of a record and of the message in it. An event that is logged
// meanwhile takes new ones.
static std::array<CxUStringBuff, 2> gCache;

void qlxDropCachedBuffers(void) {
  for (CxUStringBuff &cached : gCache) CxUStringBuffDiscard(&cached);
}

static const CxHooks gHooks{{.atClose = qlxDropCachedBuffers}};

static CxUStringBuff takeCached() {
  for (CxUStringBuff &cached : gCache)
    if (cached.data) return std::exchange(cached, {});
  return {};
}

CachedBuffer::CachedBuffer() : buffer_(takeCached()) {
  CxUStringBuffRestart(&buffer_);
}

CachedBuffer::~CachedBuffer() {
  for (CxUStringBuff &cached : gCache) {
    const bool isFree = !cached.data && buffer_.data && buffer_.capacity <= kMaxCachedBytes;
    if (isFree) std::swap(cached, buffer_);
  }
  CxUStringBuffDiscard(&buffer_);
}
