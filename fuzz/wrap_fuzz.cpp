// EventLogger::WrapText, the layout of event-log texts, over arbitrary text and buffer sizes.
//
// Properties: the output stays inside its buffer (exactly outSize units on the heap) and is
// terminated; without running out of room, its words are the input's words in order, every
// line break is "\r\n" and twenty blanks, and no line holds more than 90 units of words unless
// it holds one word too long for any line; the text ends with "\r\n" when it has a word. When
// the buffer runs out, the output is a prefix of the complete layout.
#include <memory>
#include <vector>

#include "FuzzSupport.h"
#include "owutils/EventLogger.h"

namespace {

bool IsBlank(char16_t c) { return c == u' ' || c == u'\t' || c == u'\r' || c == u'\n'; }

std::vector<std::u16string> Words(const std::u16string& text) {
  std::vector<std::u16string> words;
  size_t i = 0;
  while (i < text.size()) {
    while (i < text.size() && IsBlank(text[i])) ++i;
    size_t start = i;
    while (i < text.size() && !IsBlank(text[i])) ++i;
    if (i > start) words.push_back(text.substr(start, i - start));
  }
  return words;
}

std::u16string Wrap(const std::u16string& text, size_t outSize) {
  std::unique_ptr<char16_t[]> out(new char16_t[outSize]);
  LumoException::EventLogger::WrapText(text.c_str(), out.get(), outSize);
  const std::u16string result(out.get());
  FUZZ_CHECK(result.size() < outSize);
  return result;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const size_t outSize = input.ConsumeBool() ? input.ConsumeIntegralInRange<size_t>(1, 300) : 6144;
  const bool ascii = input.ConsumeBool();
  const std::string bytes = input.ConsumeRemainingBytesAsString();
  const std::u16string text = OwFuzz::UpToNul(ascii ? OwFuzz::Latin1(bytes) : OwFuzz::Units(bytes));

  const size_t roomy = 24 * text.size() + 64;  // a line feed becomes 22 units, the most of any
  const std::u16string whole = Wrap(text, roomy);
  FUZZ_CHECK(whole.size() + 1 < roomy);
  FUZZ_CHECK(Words(whole) == Words(text));
  const bool anyWord = !Words(text).empty();
  if (anyWord) FUZZ_CHECK(whole.size() >= 2 && whole.compare(whole.size() - 2, 2, u"\r\n") == 0);

  // Lines: every "\r\n" but the last is followed by the indent; words fill at most 90 units.
  const std::u16string indent(20, u' ');
  size_t start = 0;
  bool first = true;
  while (start < whole.size()) {
    size_t end = whole.find(u"\r\n", start);
    if (end == std::u16string::npos) end = whole.size();
    std::u16string line = whole.substr(start, end - start);
    FUZZ_CHECK(line.find(u'\r') == std::u16string::npos);
    FUZZ_CHECK(line.find(u'\n') == std::u16string::npos);
    FUZZ_CHECK(line.find(u'\t') == std::u16string::npos);
    if (!first) {
      FUZZ_CHECK(line.compare(0, indent.size(), indent) == 0);
      line = line.substr(indent.size());
    }
    const std::vector<std::u16string> words = Words(line);
    if (words.size() > 1) FUZZ_CHECK(line.size() <= 90);
    first = false;
    start = end + 2;
  }

  // A small buffer gets a prefix of the complete layout.
  const std::u16string cut = Wrap(text, outSize);
  FUZZ_CHECK(whole.compare(0, cut.size(), cut) == 0);
  if (whole.size() < outSize) FUZZ_CHECK(cut == whole);
  return 0;
}
