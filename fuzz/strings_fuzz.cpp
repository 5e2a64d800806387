// Lumo::String Split, Trim, CompareNoCase and StringList Join / multi-strings over arbitrary
// UTF-16 text.
//
// Properties: Split never yields more than maxCount elements; without cutLast, joining the
// elements with the delimiter gives the text back; with cutLast the join is a prefix of it;
// Trim leaves no trim unit at either end, keeps a piece of the original and is idempotent;
// Join reversed is the join of the reversed list; CompareNoCase of a text with itself is 0.
#include <algorithm>

#include "FuzzSupport.h"
#include "owutils/Exceptions.h"
#include "owutils/tstring.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const size_t maxCount = input.ConsumeIntegralInRange<size_t>(0, 12);
  const bool cutLast = input.ConsumeBool();
  const bool nullTrimSet = input.ConsumeBool();
  const Lumo::String delimiter(OwFuzz::UpToNul(OwFuzz::Units(input.ConsumeRandomLengthString(8))));
  const Lumo::String trimSet(OwFuzz::UpToNul(OwFuzz::Units(input.ConsumeRandomLengthString(8))));
  const Lumo::String text(OwFuzz::UpToNul(OwFuzz::Units(input.ConsumeRemainingBytesAsString())));

  // Split and Join.
  const Lumo::StringList parts = text.Split(delimiter, maxCount, cutLast);
  FUZZ_CHECK(parts.size() <= maxCount);
  if (maxCount == 0) FUZZ_CHECK(parts.empty());
  if (maxCount > 0) {
    FUZZ_CHECK(!parts.empty());
    const Lumo::String joined = parts.Join(delimiter.c_str(), false);
    if (!cutLast || delimiter.empty()) {
      FUZZ_CHECK(joined == text);
    } else {
      FUZZ_CHECK(text.compare(0, joined.size(), joined) == 0);
    }
    if (delimiter.empty()) FUZZ_CHECK(parts.size() == 1);
    // Elements other than a kept rest hold no delimiter.
    size_t checked = (!cutLast && parts.size() == maxCount) ? parts.size() - 1 : parts.size();
    if (!delimiter.empty()) {
      for (size_t i = 0; i < checked; ++i) FUZZ_CHECK(parts[i].find(delimiter) == Lumo::String::npos);
    }
    Lumo::StringList reversed(parts);
    std::reverse(reversed.begin(), reversed.end());
    FUZZ_CHECK(parts.Join(delimiter.c_str(), true) == reversed.Join(delimiter.c_str(), false));
    Lumo::String concatenated;
    for (const auto& part : parts) concatenated += part;
    FUZZ_CHECK(parts.Join(nullptr, false) == concatenated);
    try {
      (void)parts.GetAt(parts.size());
      FUZZ_CHECK(!"GetAt past the end did not raise");
    } catch (const LumoException::STLException&) {
    }
  }

  // Trim.
  const char16_t* set = nullTrimSet ? nullptr : trimSet.c_str();
  const Lumo::String effectiveSet = nullTrimSet ? Lumo::String(u" \t\n\r") : trimSet;
  Lumo::String trimmed(text);
  Lumo::String& self = trimmed.Trim(set);
  FUZZ_CHECK(&self == &trimmed);
  FUZZ_CHECK(text.find(trimmed) != Lumo::String::npos);
  if (!trimmed.empty()) {
    FUZZ_CHECK(effectiveSet.find(trimmed.front()) == Lumo::String::npos);
    FUZZ_CHECK(effectiveSet.find(trimmed.back()) == Lumo::String::npos);
  } else {
    for (char16_t c : text) FUZZ_CHECK(effectiveSet.find(c) != Lumo::String::npos);
  }
  Lumo::String again(trimmed);
  FUZZ_CHECK(again.Trim(set) == trimmed);

  // Case-insensitive comparison is reflexive and antisymmetric in sign.
  FUZZ_CHECK(text.CompareNoCase(text.c_str()) == 0);
  const int ab = text.CompareNoCase(delimiter.c_str());
  const int ba = delimiter.CompareNoCase(text.c_str());
  FUZZ_CHECK((ab < 0) == (ba > 0) && (ab == 0) == (ba == 0));

  // Multi-string: the elements joined with NULs, then the closing double NUL.
  Lumo::StringList nonEmpty;
  for (const auto& part : parts) {
    if (part.empty()) break;
    nonEmpty.push_back(part);
  }
  std::u16string multi;
  for (const auto& part : nonEmpty) {
    multi += part;
    multi.push_back(0);
  }
  multi.push_back(0);
  const Lumo::StringList fromMulti(multi.c_str());
  FUZZ_CHECK(fromMulti.size() == nonEmpty.size());
  for (size_t i = 0; i < nonEmpty.size(); ++i) FUZZ_CHECK(fromMulti[i] == nonEmpty[i]);
  return 0;
}
