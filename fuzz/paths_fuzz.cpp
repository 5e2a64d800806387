// Path operations: GetRootLength, GetRoot, IsLongPath, ToLongPath, FromLongPath, Combine, the
// bridge to native paths, and the path text of Directories (IsRoot, GetParentDirectory,
// GetContainingPath, GetDirectoryName, GetDrive, StripDrive, trailing backslashes).
//
// Input bytes pick characters from a small alphabet of what matters in paths (backslashes,
// colons, '?', "UNC" letters, dots, slashes, blanks, a non-ASCII letter), so that drive, UNC
// and long-path forms come up often. Properties: an empty path is a precondition failure;
// GetRootLength either raises InvalidUncPath or gives a length within the path, and GetRoot is
// that prefix; ToLongPath gives a long path, and FromLongPath takes drive and UNC paths back to
// themselves; Combine keeps both parts; native conversions raise only the library's exceptions.
#include "FuzzSupport.h"
#include "owutils/Directories.h"
#include "owutils/Exceptions.h"
#include "owutils/Paths.h"

namespace {

constexpr char16_t kAlphabet[] = u"\\\\\\\\:?CcUNsrvhae.\\/ x\u00e9\u4e2d$";
constexpr size_t kAlphabetSize = sizeof kAlphabet / sizeof kAlphabet[0] - 1;

std::u16string PathFrom(const std::string& bytes) {
  std::u16string path;
  for (unsigned char b : bytes) {
    // High bit set: the byte itself (another character); else a letter of the alphabet.
    path.push_back(b >= 0xC0 ? static_cast<char16_t>(b) : kAlphabet[b % kAlphabetSize]);
  }
  return path;
}

bool Contains(const std::u16string& s, const char16_t* piece) { return s.find(piece) != std::u16string::npos; }

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  OwFuzz::Sandbox();
  FuzzedDataProvider input(data, size);
  const std::u16string second = PathFrom(input.ConsumeRandomLengthString(16));
  const std::u16string text = PathFrom(input.ConsumeRemainingBytesAsString());
  const CString path(text.c_str());

  if (text.empty()) {
    try {
      (void)Paths::GetRootLength(path);
      FUZZ_CHECK(!"an empty path was accepted");
    } catch (const LumoException::PreconditionFailed0&) {
    }
    try {
      (void)Paths::ToLongPath(path);
      FUZZ_CHECK(!"an empty path was accepted");
    } catch (const LumoException::PreconditionFailed0&) {
    }
    return 0;
  }

  // Root.
  try {
    const int root = Paths::GetRootLength(path);
    FUZZ_CHECK(root > 0 && root <= static_cast<int>(text.size()));
    FUZZ_CHECK(std::u16string(Paths::GetRoot(path).GetString()) == text.substr(0, static_cast<size_t>(root)));
  } catch (const InvalidUncPath&) {
  }

  // Long-path forms.
  const bool isLong = Paths::IsLongPath(path);
  FUZZ_CHECK(isLong == Contains(text, u"\\\\?\\"));
  const CString longPath = Paths::ToLongPath(path);
  const std::u16string longText(longPath.GetString());
  FUZZ_CHECK(Paths::IsLongPath(longPath));
  if (isLong) FUZZ_CHECK(longText == text);
  const std::u16string back(Paths::FromLongPath(longPath).GetString());
  if (!isLong && (Contains(text, u":\\") || text.rfind(u"\\\\", 0) == 0)) FUZZ_CHECK(back == text);
  const std::u16string stripped(Paths::FromLongPath(path).GetString());
  if (!isLong) FUZZ_CHECK(stripped == text);
  FUZZ_CHECK(stripped.size() <= text.size());

  // Combine.
  const CString combined = Paths::Combine(path, CString(second.c_str()));
  const std::u16string joined(combined.GetString());
  FUZZ_CHECK(joined.rfind(text, 0) == 0);
  FUZZ_CHECK(joined.size() >= text.size() + second.size());
  FUZZ_CHECK(joined.compare(joined.size() - second.size(), second.size(), second) == 0);

  // Directory path text: results are pieces of the path; only the documented exceptions.
  const bool endsWithBackslash = text.back() == u'\\';
  CString withSlash(path);
  Directories::AddTrailingBackslash(withSlash);
  FUZZ_CHECK(std::u16string(withSlash.GetString()) == (endsWithBackslash ? text : text + u"\\"));
  const std::u16string without(Directories::RemoveTrailingBackslash(path).GetString());
  FUZZ_CHECK(without == (endsWithBackslash ? text.substr(0, text.size() - 1) : text));
  try {
    const bool root = Directories::IsRoot(path);
    const std::u16string parent(Directories::GetParentDirectory(path).GetString());
    FUZZ_CHECK(parent.size() <= text.size() + 1);
    const std::u16string containing(Directories::GetContainingPath(path).GetString());
    if (root) FUZZ_CHECK(containing.empty());
    if (!root) FUZZ_CHECK(text.rfind(containing, 0) == 0);
    try {
      const std::u16string name(Directories::GetDirectoryName(path).GetString());
      FUZZ_CHECK(!root);
      FUZZ_CHECK(without.size() >= name.size() &&
                 without.compare(without.size() - name.size(), name.size(), name) == 0);
    } catch (const FileSystemException&) {
      FUZZ_CHECK(root);
    }
  } catch (const InvalidUncPath&) {
  }
  const std::u16string drive(Directories::GetDrive(path).GetString());
  FUZZ_CHECK(text.rfind(drive, 0) == 0);
  const std::u16string stripped2(Directories::StripDrive(path).GetString());
  FUZZ_CHECK(stripped2.size() <= text.size());

  // Native paths: only the library's exceptions.
  try {
    const CString native = Paths::ToNativePath(path);
    (void)Paths::FromNativePath(native);
  } catch (const LumoException::Exception&) {
  }
  try {
    (void)Paths::FromNativePath(path);
  } catch (const LumoException::Exception&) {
  }
  return 0;
}
