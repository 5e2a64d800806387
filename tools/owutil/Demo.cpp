// owutil demo: the library's main job end to end in a temporary sandbox, printing each step.
//
// The sandbox is a fresh folder under the system's temporary folder; the registry and
// event-log stores (OWUTILS_STATE_DIR) and drive C: (OWUTILS_DRIVES) point into it, so the demo
// touches nothing of the user's. It is removed at the end unless --keep is given.
#include <chrono>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <random>
#include <string>

#include "Cli.h"
#include "SourceLogger.h"
#include "owutils/BitCodecs.h"
#include "owutils/CEncrypt.h"
#include "owutils/CString.h"
#include "owutils/Exceptions.h"
#include "owutils/LmFormat.h"
#include "owutils/LmOem.h"
#include "owutils/LmResources.h"
#include "owutils/SecretKey.h"
#include "owutils/StringEncodeDecode.h"

// The registry store is reached through the library's public registry calls where it has them.
#include "owutils/Registry.h"

namespace owutil {
namespace {

namespace fs = std::filesystem;

// Prints one step: "  [n] title" and its result lines indented below.
class Steps {
 public:
  void Step(const std::string& title) { std::printf("\n[%d] %s\n", ++m_count, title.c_str()); }
  void Line(const std::string& text) { std::printf("    %s\n", text.c_str()); }
  void Check(bool ok, const std::string& what) {
    std::printf("    %s %s\n", ok ? "ok:    " : "FAILED:", what.c_str());
    if (!ok) m_failed = true;
  }
  bool Failed() const { return m_failed; }

 private:
  int m_count = 0;
  bool m_failed = false;
};

fs::path MakeSandbox() {
  std::random_device random;
  std::uint64_t tag = (static_cast<std::uint64_t>(random()) << 32) ^ random() ^
                      static_cast<std::uint64_t>(std::chrono::steady_clock::now().time_since_epoch().count());
  char name[40];
  std::snprintf(name, sizeof name, "owutil-demo-%016llx", static_cast<unsigned long long>(tag));
  fs::path sandbox = fs::temp_directory_path() / name;
  fs::create_directories(sandbox / "state");
  fs::create_directories(sandbox / "C");
  return sandbox;
}

std::string ReadNative(const fs::path& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

void StringsAndExceptions(Steps& steps) {
  steps.Step("Strings and the exception framework");
  Lumo::String text;
  text.Format(u"%s formats UTF-16 text: %d units, %.2f%%, 0x%08lX", u"Lumo::String", 42, 99.5, 0xBEEFu);
  steps.Line(Utf8(text));
  try {
    try {
      PRECONDITION(text.empty());
    } catch (LumoException::Exception& e) {
      THROW_AT(UnableToOpenFile(u"C:\\data\\report.txt", e));
    }
  } catch (LumoException::Exception& e) {
    steps.Line("caught " + Utf8(e.GetMessage()) + " (root cause " + Utf8(e.GetRootCauseId()) + "); its text form:");
    std::string form = Utf8(e.ToString());
    size_t start = 0;
    while (start < form.size()) {
      size_t end = form.find('\n', start);
      if (end == std::string::npos) end = form.size();
      steps.Line("  " + form.substr(start, end - start));
      start = end + 1;
    }
  }
}

void SecretKey(Steps& steps) {
  steps.Step("Make and verify a secret-key code (AES-128, encType 9)");
  const Lumo::String key(u"correct horse battery staple");
  const Lumo::String code = MakeSecretKeyCode(key, 9);
  steps.Line("code: " + Utf8(code));
  steps.Check(VerifySecretKey(key, code, 9), "the key verifies against its code");
  steps.Check(!VerifySecretKey(Lumo::String(u"wrong key"), code, 9), "another key does not");
  steps.Check(!VerifySecretKey(key, code, 11), "nor the same key under AES-256");
}

void FileJob(Steps& steps, const fs::path& sandbox) {
  steps.Step("Encrypt, decrypt and digest a file (C:\\report.txt, which lies in the sandbox)");
  const std::string plain = "Quarterly report: 1,234 files protected, 0 lost.\nThe last 5 bytes stay plain: tail.";
  fs::path native = sandbox / "C" / "report.txt";
  std::ofstream(native, std::ios::binary) << plain;
  const CString path(u"C:\\report.txt");
  steps.Line("wrote " + std::to_string(plain.size()) + " bytes to " + native.string());

  CEncrypt sha(DIGEST_SHA1, TRUE);
  bool digested = sha.DigestFile(path) != FALSE;
  std::string before = digested ? CUtf8(sha.GetDigestResultString()) : std::string();
  steps.Check(digested, "SHA-1 of the plain file: " + before);

  CEncrypt blowfish(ENC_BLOWFISH, TRUE, CString(u"file key"));
  steps.Check(blowfish.EncryptFile(path) != FALSE, "encrypted in place with 448-bit Blowfish");
  std::string encrypted = ReadNative(native);
  steps.Check(encrypted.size() == plain.size() && encrypted != plain,
              "same length (" + std::to_string(encrypted.size()) + " bytes), different content");
  steps.Check(sha.DigestFile(path) != FALSE && CUtf8(sha.GetDigestResultString()) != before, "the digest changed");
  steps.Check(blowfish.DecryptFile(path) != FALSE && ReadNative(native) == plain, "decrypted: the file is back");
  steps.Check(sha.DigestFile(path) != FALSE && CUtf8(sha.GetDigestResultString()) == before, "and so is its digest");
  steps.Check(blowfish.EncryptFile(CString(u"C:\\missing.txt")) == FALSE, "a missing file fails without an exception");
}

void EventLog(Steps& steps) {
  steps.Step("Report an exception to the event log and read it back");
  SourceLogger logger(Lumo::String(u"OWUtilsDemo"), EngineMessageFile(), 0xC0000001);
  steps.Line("event source 'OWUtilsDemo' registered in the sandbox's registry and event log");
  try {
    try {
      THROW_AT(LumoException::Win32ErrorCode(u"CreateFile", 5));
    } catch (LumoException::Exception& e) {
      THROW_AT(UnableToOpenFile(u"C:\\report.txt", e));
    }
  } catch (LumoException::Exception& e) {
    logger.ReportException(e, u"owutil demo");
  }
  logger.ReportStrings(4, 0x20002002, {u"Nightly", u"1,234", u"1.21 GB"}, 0, nullptr);
  LumoException::EventLogger reader;
  Lumo::StringList records;
  DWORD next = 0;
  reader.ReadEventLog(1, 10, true, records, next);
  steps.Check(records.size() == 2, "two records read back from the Application log:");
  for (const Lumo::String& record : records) {
    std::string text = Utf8(record);
    size_t start = 0;
    while (start < text.size()) {
      size_t end = text.find('\n', start);
      if (end == std::string::npos) end = text.size();
      std::string line = text.substr(start, end - start);
      if (!line.empty() && line.back() == '\r') line.pop_back();
      steps.Line("  " + line);
      start = end + 1;
    }
  }
}

void Codecs(Steps& steps) {
  steps.Step("Codecs");
  const unsigned char bytes[] = {0x0F, 0xA0, 0x07, 0xC8, 0xFF};
  char hex[2 * sizeof bytes + 1], decimal[3 * sizeof bytes + 1];
  BitsToAscii(bytes, sizeof bytes, hex);
  BitsToDecimal(bytes, sizeof bytes, decimal);
  steps.Line(std::string("bytes 0f a0 07 c8 ff as hex ") + hex + ", as decimal groups " + decimal);
  Lumo::String text(u"K\u00f6ln & co/2");
  Lumo::String uri = Lumo::EncodeURI(text.c_str()), special = Lumo::EncodeSpecialChars(text.c_str());
  steps.Line("'" + Utf8(text) + "' as URI: " + Utf8(uri) + ", with special characters escaped: " + Utf8(special));
  steps.Check(Lumo::DecodeURI(uri.c_str()) == text && Lumo::DecodeSpecialChars(special.c_str()) == text,
              "both decode back");
  try {
    Lumo::DecodeURI(u"%41");
    steps.Check(false, "'%41' is refused");
  } catch (LumoException::Exception& e) {
    steps.Check(true, "'%41' is refused: " + Utf8(e.GetMessage()));
  }
}

void Resources(Steps& steps) {
  steps.Step("Pick the language and load the resource modules");
  steps.Line("language from the environment: " + std::to_string(GetLanguageId()) + " " + CUtf8(GetLanguageIdString()));
  // The product's registry value overrides the environment.
  HKEY key = nullptr;
  const DWORD german = 0x407;
  bool set = Platform::RegCreateKeyExW(HKEY_LOCAL_MACHINE, u"Software\\Orbis Works\\Orbis Works Orbis Agent", 0, nullptr,
                                       REG_OPTION_NON_VOLATILE, KEY_WRITE, nullptr, &key, nullptr) == 0 &&
             Platform::RegSetValueExW(key, u"LanguageId", 0, REG_DWORD, reinterpret_cast<const BYTE*>(&german),
                                      sizeof german) == 0;
  if (key != nullptr) Platform::RegCloseKey(key);
  steps.Check(set && GetLanguageId() == 0x407,
              "LanguageId = 0x407 in the sandbox's registry: " + std::to_string(GetLanguageId()) + " " +
                  CUtf8(GetLanguageIdString()));
  steps.Check(LoadEngineResources() && LoadAppResources(nullptr) && LoadLFResources() && LoadMessageResources(),
              "engine, application, LF and message modules loaded");
  steps.Line("engine strings 1002 and 1004: '" + CUtf8(LVXSS_get(1002)) + "', '" + CUtf8(LVXSS_get(1004)) + "'");
  CString message;
  GetErrorMessage(0xE0001001, message);
  steps.Check(!message.IsEmpty(), "message 0xE0001001 from the message module: " + CUtf8(message));
  GetErrorMessage(5, message);
  steps.Line("system error 5: " + CUtf8(message));
  steps.Line("5368709120 bytes: " + CUtf8(FormatSize(5368709120LL)) + "; February 2024 has " +
             std::to_string(GetLastDayOfMonth(2, 2024)) + " days; 1700000000 s after 1970: " +
             CUtf8(FormatTime(1700000000)));
  auto info = std::make_unique<LM_OEM_INFO>();
  if (GetOEMDataTCHAR(info.get()) == 0) {
    steps.Line("OEM record: version " + std::to_string(info->dwMajorVersion) + "." +
               std::to_string(info->dwMinorVersion) + " build " + std::to_string(info->dwBuild) + ", report name '" +
               Utf8(Lumo::String(info->szReportName)) + "'");
  } else {
    steps.Check(false, "OEM record read from the engine module");
  }
}

int Demo(bool keep) {
  std::printf("OWUtils demo: the library's main job, end to end, in a temporary sandbox\n");
  fs::path sandbox = MakeSandbox();
  // Before the library touches a store or a drive: everything goes into the sandbox.
  SetEnvironmentVariable("OWUTILS_STATE_DIR", (sandbox / "state").string());
  // Drive C: is the sandbox; the rest of the file system stays reachable as drive Z:, where the
  // library finds its resource modules.
  SetEnvironmentVariable("OWUTILS_DRIVES", "C=" + (sandbox / "C").string() + ";Z=/");
  std::printf("sandbox: %s\n  OWUTILS_STATE_DIR=%s\n  OWUTILS_DRIVES=%s\n", sandbox.string().c_str(),
              GetEnvironmentVariable("OWUTILS_STATE_DIR").c_str(), GetEnvironmentVariable("OWUTILS_DRIVES").c_str());

  Steps steps;
  StringsAndExceptions(steps);
  SecretKey(steps);
  FileJob(steps, sandbox);
  EventLog(steps);
  Codecs(steps);
  Resources(steps);

  std::printf("\n%s\n", steps.Failed() ? "demo FAILED" : "demo finished: every step passed");
  if (keep) {
    std::printf("sandbox kept: %s\n", sandbox.string().c_str());
  } else {
    std::error_code ignored;
    fs::remove_all(sandbox, ignored);
  }
  return steps.Failed() ? 1 : 0;
}

}  // namespace

void AddDemoCommand(CLI::App& app, Commands& commands) {
  auto keep = std::make_shared<bool>(false);
  CLI::App* demo = app.add_subcommand("demo", "run the library's main job end to end in a temporary sandbox and print "
                                              "each step");
  demo->add_flag("--keep", *keep, "keep the sandbox folder afterwards");
  commands.Bind(demo, [keep] { return Demo(*keep); });
}

}  // namespace owutil
