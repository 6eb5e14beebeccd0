// Appending to the UTF-16 buffer by lengths that are known.
#ifndef QLX_SRC_CXUSTRINGBUFF_H
#define QLX_SRC_CXUSTRINGBUFF_H

#include <string_view>

#include <qlx/buffers.h>

QLX_BEGIN_DECLS

// Whether so many units and the terminator fit behind the text without growing.
inline bool cxUStringBuffFits(const CxUStringBuff *buffer, uint32_t units) {
  return (uint64_t{buffer->length} + units + 1) * sizeof(UChar) <= buffer->capacity;
}

// Makes room for `extra` code units and the terminator behind the text; makes the first block.
// Returns 1, or 0 with the text unchanged.
uint8_t cxUStringBuffHasCapacity(CxUStringBuff *buffer, uint32_t extra);

// Appends bytes of the default code page, none of them zero, as CxUStringBuffAppendStr() does.
uint8_t cxUStringBuffAppend(CxUStringBuff *buffer, std::string_view text);

// Appends ASCII, whatever the default code page is.
uint8_t cxUStringBuffAppendAscii(CxUStringBuff *buffer, std::string_view text);

// Appends code units, as CxUStringBuffAppendUStr() does.
uint8_t cxUStringBuffAppendUnits(CxUStringBuff *buffer, const UChar *text, uint32_t units);

QLX_END_DECLS

#endif
