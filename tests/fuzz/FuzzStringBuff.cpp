// String buffers, against a model that is a standard string: the input is a program of appends,
// inserts and the rest. After each step text, terminator and room are compared.
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include <unicode/ustring.h>

#include <qlx/buffers.h>
#include <qlx/memory.h>

static void require(bool holds) {
  if (!holds) abort();
}

namespace {

// The program's bytes; zeros after its end.
class Input {
 public:
  Input(const uint8_t *data, size_t size) : rest_(reinterpret_cast<const char *>(data), size) {}

  bool ended() const { return rest_.empty(); }
  uint8_t byte() {
    const uint8_t first = rest_.empty() ? 0 : static_cast<uint8_t>(rest_.front());
    rest_.remove_prefix(rest_.empty() ? 0 : 1);
    return first;
  }
  int64_t number() {
    uint64_t value = 0;
    for (int i = 0; i < 8; ++i) value = value << 8 | byte();
    return static_cast<int64_t>(value) >> (byte() & 63);
  }
  // Up to 255 bytes of the program, cut at a zero, up to 16 times in a row.
  std::string text() {
    const size_t length = byte(), times = byte() & 15;
    std::string part(rest_.substr(0, length));
    rest_.remove_prefix(part.size());
    part = part.c_str();
    std::string all = part;
    for (size_t i = 0; i < times; ++i) all += part;
    return all;
  }

 private:
  std::string_view rest_;
};

}  // namespace

static void appendPart(CxStringBuff &buff, std::string &model, Input &input) {
  const std::string text = input.text();
  const int32_t count = static_cast<int8_t>(input.byte());
  require(CxStringBuffAppendStrN(&buff, text.c_str(), count) == 1);
  if (count == -1)
    model += text;
  else if (count > 0)
    model += text.substr(0, static_cast<size_t>(count));
}

static void insertText(CxStringBuff &buff, std::string &model, Input &input) {
  const std::string text = input.text();
  const auto place = static_cast<int32_t>(input.number());
  const bool fits = place >= 0 && static_cast<size_t>(place) <= model.size();
  require(CxStringBuffInsertStr(&buff, text.c_str(), place) == fits);
  if (fits) model.insert(static_cast<size_t>(place), text);
}

static void appendOwn(CxStringBuff &buff, std::string &model, Input &input) {
  if (!buff.data || model.size() > 100000) return;
  const size_t from = static_cast<size_t>(input.byte()) * model.size() / 256;
  require(CxStringBuffAppendStr(&buff, buff.data + from) == 1);
  model += std::string(model.substr(from).c_str());
}

static void appendCodePoint(CxStringBuff &buff, std::string &model, Input &input) {
  const auto codePoint = static_cast<int32_t>(input.number());
  const size_t before = buff.length;
  require(CxStringBuffAppendUTF32Char(&buff, codePoint) == 1);
  require(buff.length - before >= 1 && buff.length - before <= 6);
  model.append(buff.data + before, buff.length - before);
}

static void narrowStep(CxStringBuff &buff, std::string &model, Input &input) {
  switch (input.byte() % 10) {
    case 0: {
      const auto byte = static_cast<char>(input.byte());
      require(CxStringBuffAppendChar(&buff, byte) == 1);
      model += byte;
      break;
    }
    case 1:
      appendPart(buff, model, input);
      break;
    case 2:
      insertText(buff, model, input);
      break;
    case 3:
      appendOwn(buff, model, input);
      break;
    case 4:
      appendCodePoint(buff, model, input);
      break;
    case 5: {
      const int64_t number = input.number();
      require(CxStringBuffAppendInt64(&buff, number) == 1);
      model += std::to_string(number);
      break;
    }
    case 6: {
      const auto number = static_cast<uint64_t>(input.number());
      require(CxStringBuffAppendUInt64(&buff, number) == 1);
      model += std::to_string(number);
      break;
    }
    case 7:
      CxStringBuffPack(&buff);
      require(model.empty() ? !buff.data : buff.capacity == model.size() + 1);
      break;
    case 8:
      CxStringBuffRestart(&buff);
      model.clear();
      break;
    default: {
      char *taken = CxStringBuffTakeStr(&buff);
      require(!taken || model == std::string(taken, model.size()));
      OslMemoryFree(taken);
      model.clear();
    }
  }
  require(buff.length == model.size());
  require(!buff.data || buff.capacity > buff.length);
  require(!buff.data || model == std::string_view(buff.data, buff.length));
  require(!buff.data || buff.data[buff.length] == 0);
}

static std::u16string wide(const std::string &text) {
  std::u16string units(text.size() + 1, u'\0');
  u_uastrcpy(units.data(), text.c_str());
  return units.c_str();
}

static void wideStep(CxUStringBuff &buff, std::u16string &model, Input &input) {
  switch (input.byte() % 6) {
    case 0: {
      const auto byte = static_cast<char>(input.byte());
      require(CxUStringBuffAppendChar(&buff, byte) == 1);
      model += wide(std::string(1, byte).c_str());
      break;
    }
    case 1: {
      const std::string text = input.text();
      require(CxUStringBuffAppendStr(&buff, text.c_str()) == 1);
      model += wide(text);
      break;
    }
    case 2: {
      const std::string text = input.text();
      const int32_t count = static_cast<int8_t>(input.byte());
      require(CxUStringBuffAppendStrN(&buff, text.c_str(), count) == 1);
      if (count == -1)
        model += wide(text);
      else if (count > 0)
        model += wide(text.substr(0, static_cast<size_t>(count)));
      break;
    }
    case 3: {
      const int64_t number = input.number();
      require(CxUStringBuffAppendInt64(&buff, number) == 1);
      model += wide(std::to_string(static_cast<uint64_t>(number)));
      break;
    }
    case 4: {
      if (!buff.data || model.size() > 100000) break;
      const size_t from = static_cast<size_t>(input.byte()) * model.size() / 256;
      require(CxUStringBuffAppendUStr(&buff, buff.data + from) == 1);
      model += std::u16string(model.substr(from));
      break;
    }
    default:
      CxUStringBuffRestart(&buff);
      model.clear();
  }
  require(buff.length == model.size());
  require(!buff.data || buff.capacity >= (buff.length + 1) * sizeof(UChar));
  require(!buff.data || model == std::u16string_view(buff.data, buff.length));
  require(!buff.data || buff.data[buff.length] == 0);
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  Input input(data, size);
  CxStringBuff narrow{};
  std::string narrowModel;
  CxUStringBuff buff{};
  std::u16string wideModel;
  while (!input.ended()) {
    narrowStep(narrow, narrowModel, input);
    wideStep(buff, wideModel, input);
  }
  CxStringBuffDiscard(&narrow);
  CxUStringBuffDiscard(&buff);
  return 0;
}
