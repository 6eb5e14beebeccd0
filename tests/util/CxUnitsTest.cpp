// Loops over blocks of text against loops over single units, for every length around a block, every
// alignment and every place of the one unit that matters, and at the end of a mapped page.
#include "util/CxUnits.h"

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstdint>
#include <string>

#include "util/CxAsciiLine.h"

namespace {

constexpr size_t kMaxLength = 70;

// One of each kind that a block loop could mix up: where bits are cut, and in either byte.
constexpr UChar kUnits[] = {1,      u'A',   0x7F,   0x80,   0xFF,   0x100,  0x17F,
                            0x7F00, 0x7FFF, 0x8000, 0x8080, 0xD800, 0xFF00, 0xFFFF};
constexpr unsigned char kBytes[] = {0, 1, 'A', 0x7F, 0x80, 0xC3, 0xFE, 0xFF};

// Memory behind which there is none.
class Page {
 public:
  Page() : size_(static_cast<size_t>(sysconf(_SC_PAGESIZE))) {
    start_ = static_cast<char *>(
        mmap(nullptr, 2 * size_, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0));
    EXPECT_NE(start_, MAP_FAILED);
    EXPECT_EQ(mprotect(start_ + size_, size_, PROT_NONE), 0);
  }
  ~Page() { munmap(start_, 2 * size_); }
  Page(const Page &) = delete;
  Page &operator=(const Page &) = delete;

  // The last bytes, or units, of the page.
  template <typename Char>
  Char *last(size_t count) const {
    return reinterpret_cast<Char *>(start_ + size_) - count;
  }

 private:
  size_t size_;
  char *start_;
};

// Calls with every place in a text, and once with none.
template <typename Call>
void forEachPlace(size_t length, Call call) {
  for (size_t place = 0; place <= length; ++place) call(place);
}

// Text that ends at the end of the page, and text that begins at each alignment.
template <typename Char, typename Call>
void forEachPosition(size_t length, Call call) {
  const Page page;
  call(page.last<Char>(length));
  alignas(16) std::array<Char, kMaxLength + 32> room;
  for (size_t offset = 0; offset < 16 / sizeof(Char); ++offset) call(room.data() + offset);
}

const auto kIsOpen = [](auto units) {
  constexpr uint16_t kOpen = u'{';
  return units == kOpen;
};

}  // namespace

TEST(CxUnitsTest, TheLengthIsThatUpToTheFirstZero) {
  for (size_t length = 0; length <= kMaxLength; ++length)
    for (const UChar unit : kUnits)
      forEachPosition<UChar>(length + 1, [&](UChar *text) {
        std::fill_n(text, length, unit);
        text[length] = 0;
        ASSERT_EQ(cxUnitsLength(text), length) << std::hex << int{unit};
      });
}

TEST(CxUnitsTest, NothingBehindTheFirstZeroCounts) {
  for (size_t length = 0; length < kMaxLength; ++length)
    for (size_t second = length + 1; second <= kMaxLength; ++second)
      forEachPosition<UChar>(kMaxLength + 1, [&](UChar *text) {
        std::fill_n(text, kMaxLength + 1, u'x');
        text[length] = text[second] = 0;
        ASSERT_EQ(cxUnitsLength(text), length);
      });
}

TEST(CxUnitsTest, AUnitIsFoundInEveryPlaceAndOnlyThere) {
  for (size_t length = 0; length <= kMaxLength; ++length)
    forEachPosition<UChar>(length, [&](UChar *text) {
      forEachPlace(length, [&](size_t place) {
        std::fill_n(text, length, u'x');
        if (place < length) text[place] = u'{';
        ASSERT_EQ(cxAnyUnit(text, length, kIsOpen), place < length) << length << ' ' << place;
        if (place == length) return;
        ASSERT_FALSE(cxAnyUnit(text, place, kIsOpen)) << "the unit behind the end";
        for (const UChar other : {0x7B00, 0x017B, 0x7B7B, 0x007A, 0x807B}) {
          text[place] = other;
          ASSERT_EQ(cxAnyUnit(text, length, kIsOpen), other == u'{') << int{other};
        }
      });
    });
}

// Each of the values in each place of texts of every length at every alignment: `copy` takes those
// without a value above ASCII, and copies them.
template <typename To, typename From, typename Values, typename Copy>
void expectAsciiAlone(const Values &values, Copy copy) {
  for (size_t length = 0; length <= kMaxLength; ++length)
    for (const auto value : values)
      forEachPosition<From>(length, [&](From *text) {
        const Page out;
        forEachPlace(length, [&](size_t place) {
          for (size_t i = 0; i < length; ++i) text[i] = static_cast<From>(i * 7 % 0x80);
          if (place < length) text[place] = static_cast<From>(value);
          To *const copied = out.last<To>(length);
          ASSERT_EQ(copy(copied, text, length), place == length || value < 0x80)
              << length << ' ' << place << std::hex << ' ' << int{value};
          if (place < length && value >= 0x80) return;
          ASSERT_TRUE(std::equal(text, text + length, copied));
        });
      });
}

TEST(CxUnitsTest, NarrowsAsciiAndNothingElse) {
  expectAsciiAlone<char, UChar>(kUnits, [](auto... all) { return cxNarrowAscii(all...); });
}

TEST(CxUnitsTest, WidensAsciiAndNothingElse) {
  expectAsciiAlone<UChar, char>(kBytes, cxWidenAscii);
}

TEST(CxUnitsTest, CopiesAsciiAndNothingElse) {
  expectAsciiAlone<char, char>(kBytes, cxCopyAscii);
}

TEST(CxUnitsTest, UnitsThatShareNoBitWithAsciiDoNotPassTogether) {
  UChar units[16];
  char narrow[16];
  std::fill_n(units, 16, u'x');
  for (size_t place = 0; place < 16; ++place) {
    units[place] = 0x80;  // each block has more and more of them
    EXPECT_FALSE(cxNarrowAscii(narrow, units, 16)) << place;
  }
}

// ---- Lines of ASCII

TEST(CxAsciiLineTest, HoldsUpToItsRoomAndNoByteMore) {
  for (const size_t first : {0, 1, 4000, 4089, 4095, 4096}) {
    CxAsciiLine line;
    const std::string text(first, 'a');
    ASSERT_TRUE(line.append(text));
    const std::string rest(4096 - first, 'b');
    CxAsciiLine over = line;
    EXPECT_FALSE(over.append(rest + "c")) << first;
    EXPECT_FALSE(over.append(std::u16string(4097 - first, u'c').c_str(), 4097 - first)) << first;
    EXPECT_EQ(over.length(), first) << "a text that does not fit is not begun";
    EXPECT_TRUE(line.append(std::u16string(rest.begin(), rest.end()).c_str(), rest.size()));
    EXPECT_EQ(std::string(line.data(), line.length()), text + rest);
    EXPECT_TRUE(line.append("")) << "nothing fits always";
    EXPECT_FALSE(line.append("c"));
  }
}

TEST(CxAsciiLineTest, RefusesWhatIsNotAscii) {
  CxAsciiLine line;
  EXPECT_TRUE(line.append("ab"));
  EXPECT_FALSE(line.append("\xC3\xA4"));
  EXPECT_FALSE(line.append(u"\x0100", 1));
  EXPECT_EQ(line.length(), 2U);
}
