// Inputs found by the fuzz targets (fuzz/), kept as tests. Each case names the target that
// found it; its raw input also stays in that target's seed corpus.
#include <gtest/gtest.h>

#include "GuardedMemory.h"
#include "owutils/tstring.h"

namespace {

// format: "%.3ws" with an array of exactly three units and no terminator. A precision bounds
// what is read, so the array need not be terminated; the engine read one unit past it.
TEST(FuzzRegressionFormat, PrecisionBoundsAnUnterminatedWideString) {
  const char16_t units[] = {u'a', u'b', u'c'};
  OwTest::GuardedArray<char16_t> text(units, 3);
  Lumo::String s;
  s.Format(u"[%.3ws|%.2s|%-5.3s]", text.get(), text.get(), text.get());
  EXPECT_EQ(s, u"[abc|ab|abc  ]");
}

}  // namespace
