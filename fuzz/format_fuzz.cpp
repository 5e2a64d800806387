// The printf-style engine over UTF-16 (Lumo::detail::FormatUtf16) and Lumo::String::Format /
// AppendFormat, with formats chosen by the fuzzer.
//
// The input is read as a recipe: literal text and conversions (flags, width and precision,
// either written or taken with '*', a length modifier and a conversion from the engine's
// table). The harness knows the argument each conversion takes and passes exactly those
// arguments, with the right types, so no input can make it read a mismatched vararg. A recipe
// may end with a conversion the engine refuses (%n, unknown letters). With OWFUZZ_DUMP set, the
// program prints the format an input stands for.
//
// Properties: the engine reports the same length whatever the capacity; it never writes past
// the capacity and always terminates; a small buffer receives a prefix of the whole text;
// Format gives the whole text up to 8191 units and otherwise raises BufferTooSmall and keeps
// the previous contents; AppendFormat appends the same text; refused formats are refused.
#include <cstdarg>
#include <cstring>
#include <memory>
#include <vector>

#include "FuzzSupport.h"
#include "Strings/Formatter.h"
#include "owutils/Exceptions.h"
#include "owutils/tstring.h"

namespace {

enum class Kind { Int, Int64, IntPtr, Double, LongDouble, Pointer, Wide, Narrow };

struct Arg {
  Kind kind = Kind::Int;
  int i = 0;
  long long ll = 0;
  std::intptr_t ip = 0;
  double d = 0;
  long double ld = 0;
  void* p = nullptr;
  const char16_t* w = nullptr;
  const char* n = nullptr;
};

// A conversion of the table: length modifier, conversion letter and the argument it takes.
struct Conversion {
  const char16_t* text;
  Kind kind;
};

constexpr Conversion kConversions[] = {
    {u"d", Kind::Int},      {u"i", Kind::Int},     {u"u", Kind::Int},      {u"o", Kind::Int},
    {u"x", Kind::Int},      {u"X", Kind::Int},     {u"ld", Kind::Int},     {u"lu", Kind::Int},
    {u"lX", Kind::Int},     {u"hd", Kind::Int},    {u"hhu", Kind::Int},    {u"I32d", Kind::Int},
    {u"I64u", Kind::Int64}, {u"I64d", Kind::Int64}, {u"lld", Kind::Int64}, {u"llx", Kind::Int64},
    {u"jd", Kind::Int64},   {u"Id", Kind::IntPtr}, {u"Iu", Kind::IntPtr},  {u"zu", Kind::IntPtr},
    {u"tX", Kind::IntPtr},  {u"e", Kind::Double},  {u"E", Kind::Double},   {u"f", Kind::Double},
    {u"F", Kind::Double},   {u"g", Kind::Double},  {u"G", Kind::Double},   {u"a", Kind::Double},
    {u"lf", Kind::Double},  {u"Lf", Kind::LongDouble}, {u"Lg", Kind::LongDouble},
    {u"p", Kind::Pointer},  {u"c", Kind::Int},     {u"C", Kind::Int},      {u"hc", Kind::Int},
    {u"lc", Kind::Int},     {u"wc", Kind::Int},    {u"s", Kind::Wide},     {u"ls", Kind::Wide},
    {u"ws", Kind::Wide},    {u"S", Kind::Narrow},  {u"hs", Kind::Narrow},  {u"hS", Kind::Narrow},
    {u"lS", Kind::Wide},
};

// Conversions the engine refuses: the recipe stops after one of them.
constexpr const char16_t* kRefused[] = {u"n", u"ln", u"q", u"k", u"y", u"Ly", u"\x263a"};

constexpr size_t kMaxArgs = 3;

struct Recipe {
  std::u16string format;
  std::vector<Arg> args;
  bool refused = false;
  // Storage for string arguments.
  std::vector<std::unique_ptr<char16_t[]>> wide;
  std::vector<std::unique_ptr<char[]>> narrow;
};

int ReadField(FuzzedDataProvider& input) {
  switch (input.ConsumeIntegralInRange<int>(0, 7)) {
    case 0: return input.ConsumeIntegralInRange<int>(1000, 9000);  // near the buffer limits
    case 1: return input.ConsumeIntegralInRange<int>(90000, 110000);  // around the refusal limit
    default: return input.ConsumeIntegralInRange<int>(0, 40);
  }
}

void AddIntArg(Recipe& recipe, int value) {
  Arg arg;
  arg.kind = Kind::Int;
  arg.i = value;
  recipe.args.push_back(arg);
}

Recipe ReadRecipe(FuzzedDataProvider& input) {
  Recipe recipe;
  while (input.remaining_bytes() > 0 && !recipe.refused) {
    if (input.ConsumeBool()) {
      // Literal text (no '%' of its own, no NUL).
      for (char16_t c : OwFuzz::Units(input.ConsumeRandomLengthString(16))) {
        if (c == 0) continue;
        if (c == u'%') recipe.format += u"%%";
        else recipe.format.push_back(c);
      }
      continue;
    }
    if (recipe.args.size() >= kMaxArgs) break;
    recipe.format.push_back(u'%');
    if (input.ConsumeIntegralInRange<int>(0, 15) == 0) {
      recipe.format += u"%";
      continue;
    }
    static constexpr char16_t kFlags[] = u"-+ #0";
    const uint8_t flags = input.ConsumeIntegral<uint8_t>();
    for (int f = 0; f < 5; ++f) {
      if (flags & (1u << f)) recipe.format.push_back(kFlags[f]);
    }
    int precision = -1;
    // Width: none, written, or '*'.
    switch (input.ConsumeIntegralInRange<int>(0, 2)) {
      case 1: recipe.format += Lumo::String(std::to_string(ReadField(input)).c_str()); break;
      case 2:
        if (recipe.args.size() + 2 <= kMaxArgs) {  // room for this and the conversion's own
          recipe.format.push_back(u'*');
          AddIntArg(recipe, input.ConsumeBool() ? input.ConsumeIntegral<int>() : ReadField(input) * (input.ConsumeBool() ? -1 : 1));
        }
        break;
      default: break;
    }
    // Precision: none, written, or '*'.
    switch (input.ConsumeIntegralInRange<int>(0, 2)) {
      case 1:
        precision = ReadField(input);
        recipe.format += u"." + Lumo::String(std::to_string(precision).c_str());
        break;
      case 2:
        if (recipe.args.size() + 2 <= kMaxArgs) {
          recipe.format += u".*";
          precision = input.ConsumeBool() ? input.ConsumeIntegral<int>() : ReadField(input);
          AddIntArg(recipe, precision);
          if (precision < 0) precision = -1;
        }
        break;
      default: break;
    }
    if (input.ConsumeIntegralInRange<int>(0, 31) == 0) {
      recipe.format += kRefused[input.ConsumeIntegralInRange<size_t>(0, std::size(kRefused) - 1)];
      recipe.refused = true;
      break;
    }
    const Conversion& conversion = kConversions[input.ConsumeIntegralInRange<size_t>(0, std::size(kConversions) - 1)];
    recipe.format += conversion.text;
    Arg arg;
    arg.kind = conversion.kind;
    switch (conversion.kind) {
      case Kind::Int: arg.i = input.ConsumeIntegral<int>(); break;
      case Kind::Int64: arg.ll = input.ConsumeIntegral<long long>(); break;
      case Kind::IntPtr: arg.ip = input.ConsumeIntegral<std::intptr_t>(); break;
      case Kind::Double: arg.d = input.ConsumeFloatingPoint<double>(); break;
      case Kind::LongDouble: arg.ld = input.ConsumeFloatingPoint<double>(); break;
      case Kind::Pointer: arg.p = reinterpret_cast<void*>(input.ConsumeIntegral<std::uintptr_t>()); break;
      case Kind::Wide: {
        if (input.ConsumeIntegralInRange<int>(0, 15) == 0) break;  // a null string prints "(null)"
        std::u16string text = OwFuzz::UpToNul(OwFuzz::Units(input.ConsumeRandomLengthString(24)));
        // With a precision no larger than the text, the array need not be terminated: it is
        // exactly `precision` units long, so reading one unit more is caught.
        size_t units = precision >= 0 && static_cast<size_t>(precision) <= text.size() ? precision : text.size() + 1;
        auto buffer = std::make_unique<char16_t[]>(units == 0 ? 1 : units);
        std::copy(text.begin(), text.begin() + std::min(units, text.size()), buffer.get());
        if (units > text.size()) buffer[text.size()] = 0;
        arg.w = buffer.get();
        recipe.wide.push_back(std::move(buffer));
        break;
      }
      case Kind::Narrow: {
        if (input.ConsumeIntegralInRange<int>(0, 15) == 0) break;
        std::string text = OwFuzz::UpToNul(input.ConsumeRandomLengthString(24));
        auto buffer = std::make_unique<char[]>(text.size() + 1);
        std::memcpy(buffer.get(), text.c_str(), text.size() + 1);
        arg.n = buffer.get();
        recipe.narrow.push_back(std::move(buffer));
        break;
      }
    }
    recipe.args.push_back(arg);
  }
  return recipe;
}

std::string Printable(const std::u16string& text) {
  std::string out;
  for (char16_t c : text) {
    if (c >= 0x20 && c < 0x7F) {
      out.push_back(static_cast<char>(c));
    } else {
      char escape[8];
      std::snprintf(escape, sizeof escape, "\\u%04X", static_cast<unsigned>(c));
      out += escape;
    }
  }
  return out;
}

int Measure(char16_t* out, size_t capacity, const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  int length = Lumo::detail::FormatUtf16(out, capacity, format, args);
  va_end(args);
  return length;
}

template <typename... Values>
void Check(const Recipe& recipe, size_t smallCapacity, Values... values) {
  const char16_t* format = recipe.format.c_str();
  const int length = Measure(nullptr, 0, format, values...);
  if (recipe.refused) FUZZ_CHECK(length == -1);
  std::u16string whole;
  if (length >= 0) {
    // Exactly length + 1 units: a write past the end is caught.
    auto buffer = std::make_unique<char16_t[]>(static_cast<size_t>(length) + 1);
    FUZZ_CHECK(Measure(buffer.get(), static_cast<size_t>(length) + 1, format, values...) == length);
    FUZZ_CHECK(buffer[static_cast<size_t>(length)] == 0);
    whole.assign(buffer.get(), static_cast<size_t>(length));

    auto small = std::make_unique<char16_t[]>(smallCapacity);
    FUZZ_CHECK(Measure(small.get(), smallCapacity, format, values...) == length);
    const size_t kept = std::min(static_cast<size_t>(length), smallCapacity - 1);
    FUZZ_CHECK(small[kept] == 0);
    FUZZ_CHECK(whole.compare(0, kept, small.get(), kept) == 0);
  }

  Lumo::String formatted(u"before");
  Lumo::String appended(u"before");
  const bool fits = length >= 0 && length <= 8191;
  try {
    formatted.Format(format, values...);
    FUZZ_CHECK(fits);
    FUZZ_CHECK(formatted == whole);
  } catch (const LumoException::BufferTooSmall&) {
    FUZZ_CHECK(!fits);
    FUZZ_CHECK(formatted == u"before");
  }
  try {
    appended.AppendFormat(format, values...);
    FUZZ_CHECK(fits);
    FUZZ_CHECK(appended == u"before" + whole);
  } catch (const LumoException::BufferTooSmall&) {
    FUZZ_CHECK(!fits);
    FUZZ_CHECK(appended == u"before");
  }
}

// Calls Check with the recipe's arguments as real, correctly typed varargs.
template <typename... Values>
void Dispatch(const Recipe& recipe, size_t smallCapacity, size_t index, Values... values) {
  if constexpr (sizeof...(Values) < kMaxArgs) {
    if (index < recipe.args.size()) {
      const Arg& a = recipe.args[index];
      switch (a.kind) {
        case Kind::Int: return Dispatch(recipe, smallCapacity, index + 1, values..., a.i);
        case Kind::Int64: return Dispatch(recipe, smallCapacity, index + 1, values..., a.ll);
        case Kind::IntPtr: return Dispatch(recipe, smallCapacity, index + 1, values..., a.ip);
        case Kind::Double: return Dispatch(recipe, smallCapacity, index + 1, values..., a.d);
        case Kind::LongDouble: return Dispatch(recipe, smallCapacity, index + 1, values..., a.ld);
        case Kind::Pointer: return Dispatch(recipe, smallCapacity, index + 1, values..., a.p);
        case Kind::Wide: return Dispatch(recipe, smallCapacity, index + 1, values..., a.w);
        case Kind::Narrow: return Dispatch(recipe, smallCapacity, index + 1, values..., a.n);
      }
    }
  }
  Check(recipe, smallCapacity, values...);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const size_t smallCapacity = input.ConsumeIntegralInRange<size_t>(1, 48);
  const Recipe recipe = ReadRecipe(input);
  if (std::getenv("OWFUZZ_DUMP") != nullptr) {  // triage: show the format an input stands for
    std::fprintf(stderr, "format: \"%s\", %zu arguments\n", Printable(recipe.format).c_str(), recipe.args.size());
  }
  if (recipe.args.size() > kMaxArgs) return 0;
  Dispatch(recipe, smallCapacity, 0);
  return 0;
}
