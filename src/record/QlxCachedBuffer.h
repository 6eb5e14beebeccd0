// Buffers for the texts of a record: their blocks are cached, so that a record allocates none.
#ifndef QLX_SRC_QLXCACHEDBUFFER_H
#define QLX_SRC_QLXCACHEDBUFFER_H

#include <string_view>

#include <qlx/buffers.h>

QLX_BEGIN_DECLS

// Frees the cached blocks.
void qlxDropCachedBuffers(void);

QLX_END_DECLS

// An empty buffer, which takes a cached block, if there is one, and leaves its own to the next. The
// API lock is held.
class CachedBuffer {
 public:
  CachedBuffer();
  ~CachedBuffer();
  CachedBuffer(const CachedBuffer &) = delete;
  CachedBuffer &operator=(const CachedBuffer &) = delete;

  CxUStringBuff *get() { return &buffer_; }
  std::u16string_view text() const { return {buffer_.data ? buffer_.data : u"", buffer_.length}; }

 private:
  CxUStringBuff buffer_;
};

#endif
