// WhitespaceTokenizer over arbitrary UTF-16 text.
//
// Properties: the tokens put back together give the text; every separator token is one of
// " \t\r\n"; word tokens are non-empty and hold no separator; the token list ends with null;
// a cursor walks forwards to the end and back to the start over the same tokens.
#include <cstring>

#include "FuzzSupport.h"
#include "owutils/tstring.h"

namespace {
bool IsSeparator(char16_t c) { return c == u' ' || c == u'\t' || c == u'\r' || c == u'\n'; }
}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::u16string text =
      OwFuzz::UpToNul(OwFuzz::Units(std::string(reinterpret_cast<const char*>(data), size)));
  Lumo::WhitespaceTokenizer tokenizer(text.c_str());

  const size_t count = tokenizer.GetTokenCount();
  FUZZ_CHECK(count <= text.size());
  FUZZ_CHECK(tokenizer.GetToken(count) == nullptr);
  FUZZ_CHECK(tokenizer.GetToken(count + 7) == nullptr);

  std::u16string joined;
  for (size_t i = 0; i < count; ++i) {
    const char16_t* token = tokenizer.GetToken(i);
    FUZZ_CHECK(token != nullptr);
    FUZZ_CHECK(token[0] != 0);
    if (IsSeparator(token[0])) {
      FUZZ_CHECK(Lumo::WhitespaceTokenizer::IsSeparator(token[0]));
      joined.push_back(token[0]);
    } else {
      std::u16string word(token);
      for (char16_t c : word) FUZZ_CHECK(!IsSeparator(c));
      joined += word;
    }
  }
  FUZZ_CHECK(joined == text);

  Lumo::WhitespaceTokenizer::Cursor cursor(tokenizer);
  FUZZ_CHECK(cursor.Previous() == nullptr);
  for (size_t i = 0; i < count; ++i) FUZZ_CHECK(cursor.Next() == tokenizer.GetToken(i));
  FUZZ_CHECK(cursor.Next() == nullptr);
  for (size_t i = count; i > 0; --i) FUZZ_CHECK(cursor.Previous() == tokenizer.GetToken(i - 1));
  FUZZ_CHECK(cursor.Previous() == nullptr);
  return 0;
}
