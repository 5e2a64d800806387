// Security commands: types, digest, encrypt-file, decrypt-file, encrypt-string,
// decrypt-string, make-code, verify-key.
#include <cstdio>
#include <filesystem>
#include <memory>
#include <vector>

#include "Cli.h"
#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "owutils/SecretKey.h"

namespace owutil {
namespace {

int ParseEncType(const std::string& text) {
  return static_cast<int>(ParseInteger(text, "ENCTYPE", 1, 11));
}

std::optional<std::uint64_t> NativeFileSize(const std::string& nativePath) {
  std::error_code error;
  std::uintmax_t size = std::filesystem::file_size(nativePath, error);
  if (error) return std::nullopt;
  return static_cast<std::uint64_t>(size);
}

CString ToCString(const Lumo::String& text) { return CString(static_cast<const std::u16string&>(text)); }
int Types() {
  std::printf("%-4s  %-10s  %8s  %5s  %s\n", "CODE", "NAME", "KEY_BITS", "BLOCK", "DISPLAY_NAME");
  for (const TypeInfo& type : TypeTable()) {
    std::string display;
    if (type.digest) {
      display = "(digest of " + std::to_string(type.blockBytes * 8) + " bits)";
    } else {
      display = Utf8(Lumo::String(CEncrypt::GetEncryptionTypeString(type.code)));
    }
    std::string keyBits = type.digest ? "-" : std::to_string(type.keyBits);
    std::printf("%-4d  %-10s  %8s  %5d  %s\n", type.code, type.name, keyBits.c_str(), type.blockBytes, display.c_str());
  }
  return 0;
}

// Digests standard input with Digest over 64 KiB reads.
std::string DigestStdin(CEncrypt& digest) {
  Progress progress("(standard input)", std::nullopt);
  digest.ResetDigest();
  std::vector<BYTE> buffer(64 * 1024);
  size_t n;
  while ((n = std::fread(buffer.data(), 1, buffer.size(), stdin)) > 0) {
    digest.Digest(buffer.data(), static_cast<int>(n));
    progress.Add(n);
  }
  if (std::ferror(stdin)) {
    progress.Finish(false);
    throw Failure("cannot read standard input");
  }
  progress.Finish(true);
  return CUtf8(digest.GetDigestResultString());
}

// Digests one file; on a terminal in one-second slices so that the display stays alive.
bool DigestOneFile(CEncrypt& digest, const std::string& nativePath, std::string& hex) {
  CString path = ToCString(LibraryPath(nativePath));
  BOOL ok = FALSE;
  if (StderrIsTerminal()) {
    Progress progress(nativePath, NativeFileSize(nativePath));
    BOOL first = TRUE, done = FALSE;
    do {
      ok = digest.DigestFileWTimeout(path, 1, &first, &done);
    } while (ok && !done);
    progress.Finish(ok != FALSE);
  } else {
    ok = digest.DigestFile(path);
  }
  if (!ok) return false;
  hex = CUtf8(digest.GetDigestResultString());
  return true;
}

struct DigestOptions {
  std::string type = "sha1";
  std::string text;
  CLI::Option* textOption = nullptr;
  std::vector<std::string> files;
};

int Digest(const DigestOptions& options) {
  const TypeInfo& type = ParseDigestType(options.type);
  CEncrypt digest(type.code, TRUE);
  if (options.textOption->count() > 0) {
    if (!options.files.empty()) throw UsageError("--string and FILE cannot be given together");
    digest.DigestString(ToCString(Wide(options.text, "TEXT")));
    PrintLine(CUtf8(digest.GetDigestResultString()));
    return 0;
  }
  std::vector<std::string> files = options.files;
  if (files.empty()) files.push_back("-");
  int status = 0;
  for (const std::string& file : files) {
    std::string hex;
    if (file == "-") {
      hex = DigestStdin(digest);
    } else if (!DigestOneFile(digest, file, hex)) {
      std::fprintf(stderr, "owutil: %s: cannot digest the file\n", file.c_str());
      status = 1;
      continue;
    }
    PrintLine(hex + "  " + file);
    std::fflush(stdout);
  }
  return status;
}

struct CipherOptions {
  std::string type;
  KeyOptions key;
  bool reduced = false;
  std::vector<std::string> items;  // files, or the one text
};

std::unique_ptr<CEncrypt> MakeCipher(const CipherOptions& options) {
  const TypeInfo& type = ParseCipherType(options.type);
  Lumo::String key = options.key.Read();
  return std::make_unique<CEncrypt>(type.code, options.reduced ? FALSE : TRUE, ToCString(key));
}

int ProcessFiles(const CipherOptions& options, bool encrypt) {
  std::unique_ptr<CEncrypt> cipher = MakeCipher(options);
  int status = 0;
  for (const std::string& file : options.items) {
    CString path = ToCString(LibraryPath(file));
    Progress progress(file, NativeFileSize(file));
    BOOL ok = encrypt ? cipher->EncryptFile(path) : cipher->DecryptFile(path);
    progress.Finish(ok != FALSE);
    if (!ok) {
      std::error_code error;
      const char* why = std::filesystem::exists(file, error) ? "" : " (no such file)";
      std::fprintf(stderr, "owutil: %s: cannot %s the file%s\n", file.c_str(), encrypt ? "encrypt" : "decrypt", why);
      status = 1;
    }
  }
  return status;
}

int EncryptString(const CipherOptions& options) {
  Lumo::String text = Wide(options.items.at(0), "TEXT");
  if (text.empty()) throw UsageError("TEXT is empty");
  std::unique_ptr<CEncrypt> cipher = MakeCipher(options);
  PrintLine(CUtf8(cipher->EncryptString(ToCString(text))));
  return 0;
}

int DecryptString(const CipherOptions& options) {
  const std::string& hex = options.items.at(0);
  if (!IsHexText(hex)) throw UsageError("HEX must be hexadecimal digits, not '" + hex + "'");
  if (hex.size() % 2 != 0) throw UsageError("HEX must have an even number of digits");
  std::unique_ptr<CEncrypt> cipher = MakeCipher(options);
  PrintLine(CUtf8(cipher->DecryptString(ToCString(Wide(hex, "HEX")))));
  return 0;
}

struct CodeOptions {
  std::string encType;
  KeyOptions key;
  std::string code;
};

int MakeCode(const CodeOptions& options) {
  const int encType = ParseEncType(options.encType);
  PrintLine(Utf8(MakeSecretKeyCode(options.key.Read(), encType)));
  return 0;
}

int VerifyKey(const CodeOptions& options) {
  int encType = ParseEncType(options.encType);
  if (!IsHexText(options.code)) throw UsageError("CODE must be hexadecimal digits, not '" + options.code + "'");
  Lumo::String key = options.key.Read();
  bool valid = VerifySecretKey(key, Wide(options.code, "CODE"), encType);
  PrintLine(valid ? "valid" : "invalid");
  return valid ? 0 : 1;
}

void AddCipherOptions(CLI::App* sub, CipherOptions& options, bool withReduced) {
  sub->add_option("-t,--type", options.type, "cipher: code 1-13 or " + TypeNames(false))->required()->type_name("TYPE");
  options.key.Add(sub);
  if (withReduced) sub->add_flag("--reduced", options.reduced, "reduced key strength (export grade)");
}

}  // namespace

void AddSecurityCommands(CLI::App& app, Commands& commands) {
  CLI::App* types = app.add_subcommand("types", "list every type code with its name, key bits, block size and display name");
  commands.Bind(types, [] { return Types(); });

  auto digest = std::make_shared<DigestOptions>();
  CLI::App* dg = app.add_subcommand("digest", "digest files (or standard input for '-' or no FILE), printed as 'HEX  FILE'");
  dg->add_option("-t,--type", digest->type, "digest: sha1 (default), ripemd160, md5, crc32 or code 20, 21, 22, 30")
      ->type_name("TYPE");
  digest->textOption = dg->add_option("--string", digest->text, "digest TEXT's UTF-8 bytes instead, printed as 'HEX'")
                           ->type_name("TEXT");
  dg->add_option("FILE", digest->files, "files to digest; '-' is standard input")->type_name("FILE");
  dg->footer("Example: owutil digest -t md5 report.pdf");
  commands.Bind(dg, [digest] { return Digest(*digest); });

  for (bool encrypt : {true, false}) {
    auto options = std::make_shared<CipherOptions>();
    CLI::App* sub = app.add_subcommand(encrypt ? "encrypt-file" : "decrypt-file",
                                       encrypt ? "encrypt files in place (same name, same length); exit 1 when any fails"
                                               : "decrypt files in place; exit 1 when any fails");
    AddCipherOptions(sub, *options, true);
    sub->add_option("FILE", options->items, "files to process")->required()->type_name("FILE");
    sub->footer(encrypt ? "Example: owutil encrypt-file -t aes256 --key-file key.txt data.bin" : "");
    commands.Bind(sub, [options, encrypt] { return ProcessFiles(*options, encrypt); });
  }

  auto encryptString = std::make_shared<CipherOptions>();
  CLI::App* es = app.add_subcommand("encrypt-string", "encrypt TEXT's UTF-8 bytes, printed as lower-case hex");
  AddCipherOptions(es, *encryptString, true);
  es->add_option("TEXT", encryptString->items, "the text")->required()->expected(1);
  es->footer("Example: owutil encrypt-string -t twofish -k secret 'some text'");
  commands.Bind(es, [encryptString] { return EncryptString(*encryptString); });

  auto decryptString = std::make_shared<CipherOptions>();
  CLI::App* ds = app.add_subcommand("decrypt-string", "decrypt HEX made by encrypt-string, printed as text");
  AddCipherOptions(ds, *decryptString, true);
  ds->add_option("HEX", decryptString->items, "the hex ciphertext")->required()->expected(1);
  commands.Bind(ds, [decryptString] { return DecryptString(*decryptString); });

  auto makeCode = std::make_shared<CodeOptions>();
  CLI::App* mc = app.add_subcommand("make-code", "print the 64-digit secret-key code that verify-key accepts");
  mc->add_option("-e,--enc-type", makeCode->encType,
                 "1 blowfish, 2 3des, 3 des, 4 safer-sk, 5 idea, 6 rc5, 7 twofish, 8 mars, 9 aes128, 10 aes192, 11 aes256")
      ->required()
      ->type_name("ENCTYPE");
  makeCode->key.Add(mc);
  mc->footer("Example: owutil make-code -e 9 --key-stdin < key.txt");
  commands.Bind(mc, [makeCode] { return MakeCode(*makeCode); });

  auto verify = std::make_shared<CodeOptions>();
  CLI::App* vk = app.add_subcommand("verify-key", "check a key against a secret-key code: prints 'valid' (exit 0) or "
                                                  "'invalid' (exit 1)");
  vk->add_option("-e,--enc-type", verify->encType, "encryption type 1-11, as for make-code")->required()->type_name("ENCTYPE");
  verify->key.Add(vk);
  vk->add_option("-c,--code", verify->code, "the hex code")->required()->type_name("CODE");
  vk->footer("Example: owutil verify-key -e 9 --key-file key.txt -c 3f0a...");
  commands.Bind(vk, [verify] { return VerifyKey(*verify); });
}

}  // namespace owutil
