// types, digest, encrypt-file, decrypt-file, encrypt-string, decrypt-string, make-code,
// verify-key.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <regex>

#include "ToolRunner.h"
#include "support/TestEnvironment.h"

namespace OwTest {
namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using ::testing::Not;

TEST(ToolTypes, ListsEveryCodeWithNameKeyBitsBlockAndDisplayName) {
  ToolResult result = RunTool({"types"});
  ASSERT_EQ(result.status, 0) << result.err;
  EXPECT_THAT(result.out, MatchesRegex("CODE +NAME +KEY_BITS +BLOCK +DISPLAY_NAME\n(.|\n)*"));
  // One line per code: code, name, key bits, block or digest bytes, display name.
  EXPECT_THAT(result.out, HasSubstr("\n1     blowfish         448      8  448-bit BlowFish\n"));
  EXPECT_THAT(result.out, HasSubstr("\n6     rc5             2048      8  2048-bit RC5\n"));
  EXPECT_THAT(result.out, HasSubstr("\n8     des2             128      8  128-bit DES\n"));
  EXPECT_THAT(result.out, HasSubstr("\n13    aes256           256     16  256-bit AES\n"));
  EXPECT_THAT(result.out, HasSubstr("\n30    crc32              -      4  (digest of 32 bits)\n"));
  EXPECT_EQ(std::count(result.out.begin(), result.out.end(), '\n'), 18);
}

// Digests of "abc": FIPS 180-4 appendix (SHA-1), RFC 1321 appendix A.5 (MD5), the RIPEMD-160
// paper's test vectors; CRC-32 of "123456789" is the check value cbf43926 of the CRC catalogue,
// printed least significant byte first.
TEST(ToolDigest, StringDigestsMatchPublishedValues) {
  const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
      {{"digest", "--string", "abc"}, "a9993e364706816aba3e25717850c26c9cd0d89d\n"},
      {{"digest", "-t", "sha1", "--string", "abc"}, "a9993e364706816aba3e25717850c26c9cd0d89d\n"},
      {{"digest", "-t", "20", "--string", "abc"}, "a9993e364706816aba3e25717850c26c9cd0d89d\n"},
      {{"digest", "-t", "md5", "--string", "abc"}, "900150983cd24fb0d6963f7d28e17f72\n"},
      {{"digest", "-t", "RIPEMD160", "--string", "abc"}, "8eb208f7e05d987a9b044a8e98c6b087f15a0bfc\n"},
      {{"digest", "-t", "crc32", "--string", "123456789"}, "2639f4cb\n"},
      {{"digest", "-t", "md5", "--string", ""}, "d41d8cd98f00b204e9800998ecf8427e\n"},
  };
  for (const auto& [args, expected] : cases) {
    ToolResult result = RunTool(args);
    EXPECT_EQ(result.status, 0) << result.err;
    EXPECT_EQ(result.out, expected) << args.back();
  }
}

TEST(ToolDigest, FilesAndStandardInputPrintLikeSha1sum) {
  std::string dir = MakeTempDirectory();
  std::string abc = WriteFile(dir + "/abc.txt", "abc");
  std::string empty = WriteFile(dir + "/empty", "");
  ToolResult result = RunTool({"digest", abc, "-", empty}, "abc");
  EXPECT_EQ(result.status, 0) << result.err;
  EXPECT_EQ(result.out, "a9993e364706816aba3e25717850c26c9cd0d89d  " + abc +
                            "\na9993e364706816aba3e25717850c26c9cd0d89d  -\n"
                            "da39a3ee5e6b4b0d3255bfef95601890afd80709  " + empty + "\n");
  EXPECT_EQ(result.err, "");  // no progress display: standard error is not a terminal

  ToolResult stdinOnly = RunTool({"digest", "-t", "md5"}, "abc");
  EXPECT_EQ(stdinOnly.out, "900150983cd24fb0d6963f7d28e17f72  -\n");
}

TEST(ToolDigest, BigFileAcrossManyReadsMatchesTheStringDigest) {
  // 1 MiB + 7: more than the 16-read slices of a sliced digest, and a partial last read.
  std::string content;
  for (int i = 0; content.size() < (1u << 20) + 7; ++i) content += std::to_string(i) + ",";
  content.resize((1u << 20) + 7);
  std::string file = WriteFile(MakeTempDirectory() + "/big.bin", content);
  ToolResult fromFile = RunTool({"digest", "-t", "md5", file});
  ToolResult fromStdin = RunTool({"digest", "-t", "md5", "-"}, content);
  ASSERT_EQ(fromFile.status, 0) << fromFile.err;
  EXPECT_EQ(fromFile.out.substr(0, 32), fromStdin.out.substr(0, 32));
}

TEST(ToolDigest, ProgressIsShownOnlyWhenStandardErrorIsATerminal) {
  std::string file = WriteFile(MakeTempDirectory() + "/data.bin", std::string(3 << 20, 'x'));
  ToolRun run;
  run.args = {"digest", file};
  run.stderrTerminal = true;
  ToolResult result = RunTool(run);
  EXPECT_EQ(result.status, 0);
  EXPECT_THAT(result.out, MatchesRegex("[0-9a-f]{40}  .*data.bin\n"));
  EXPECT_THAT(result.err, HasSubstr("data.bin"));
  EXPECT_THAT(result.err, HasSubstr("3.0 MiB"));
  EXPECT_THAT(result.err, HasSubstr("/s"));

  // The file commands show the same line; their results on standard output stay clean.
  run.args = {"encrypt-file", "-t", "aes128", "-k", "k", file};
  ToolResult encrypted = RunTool(run);
  EXPECT_EQ(encrypted.status, 0);
  EXPECT_EQ(encrypted.out, "");
  EXPECT_THAT(encrypted.err, HasSubstr("data.bin"));
  EXPECT_THAT(encrypted.err, HasSubstr("3.0 MiB in "));
}

TEST(ToolDigest, MissingFileFailsWithOneButTheOthersAreDigested) {
  std::string dir = MakeTempDirectory();
  std::string abc = WriteFile(dir + "/abc.txt", "abc");
  ToolResult result = RunTool({"digest", dir + "/missing.txt", abc});
  EXPECT_EQ(result.status, 1);
  EXPECT_THAT(result.err, HasSubstr("missing.txt: cannot digest the file"));
  EXPECT_EQ(result.out, "a9993e364706816aba3e25717850c26c9cd0d89d  " + abc + "\n");
}

TEST(ToolDigest, StringAndFilesTogetherIsBadInput) {
  ToolResult result = RunTool({"digest", "--string", "abc", "file"});
  EXPECT_EQ(result.status, 2);
}

TEST(ToolFiles, EncryptThenDecryptRestoresEveryFileAndKeepsTheLength) {
  std::string dir = MakeTempDirectory();
  const std::string a = std::string(20485, 'a') + "tail", b = "short";  // b is less than one block
  std::string fileA = WriteFile(dir + "/a.bin", a), fileB = WriteFile(dir + "/b.bin", b);
  std::string keyFile = WriteFile(dir + "/key", "file key\r\n");
  for (const char* type : {"aes256", "3", "blowfish2"}) {
    ToolResult enc = RunTool({"encrypt-file", "-t", type, "--key-file", keyFile, fileA, fileB});
    ASSERT_EQ(enc.status, 0) << enc.err;
    EXPECT_EQ(enc.out, "");
    std::string encrypted = ReadFile(fileA);
    EXPECT_EQ(encrypted.size(), a.size());
    EXPECT_NE(encrypted, a);
    EXPECT_EQ(ReadFile(fileB), b);
    // The same key from standard input (first line only) decrypts.
    ToolResult dec = RunTool({"decrypt-file", "-t", type, "--key-stdin", fileA, fileB}, "file key\nignored\n");
    ASSERT_EQ(dec.status, 0) << dec.err;
    EXPECT_EQ(ReadFile(fileA), a) << type;
  }
}

TEST(ToolFiles, ReducedStrengthIsADifferentKey) {
  std::string dir = MakeTempDirectory();
  const std::string text(64, 'p');
  std::string full = WriteFile(dir + "/full", text), reduced = WriteFile(dir + "/reduced", text);
  ToolResult r1 = RunTool({"encrypt-file", "-t", "des", "-k", "k", full});
  RunTool({"encrypt-file", "-t", "des", "-k", "k", "--reduced", reduced});
  EXPECT_NE(ReadFile(full), ReadFile(reduced));
  RunTool({"decrypt-file", "-t", "des", "-k", "k", "--reduced", reduced});
  EXPECT_EQ(ReadFile(reduced), text);
}

TEST(ToolFiles, AnyFailingFileGivesExitOne) {
  std::string dir = MakeTempDirectory();
  std::string good = WriteFile(dir + "/good", std::string(32, 'g'));
  ToolResult result = RunTool({"encrypt-file", "-t", "aes128", "-k", "Sup3rSecret", dir + "/missing", good});
  EXPECT_EQ(result.status, 1);
  EXPECT_THAT(result.err, HasSubstr("missing: cannot encrypt the file (no such file)"));
  EXPECT_THAT(result.err, Not(HasSubstr("Sup3rSecret")));
  EXPECT_NE(ReadFile(good), std::string(32, 'g'));  // the good one was still processed
  ToolResult digestType = RunTool({"encrypt-file", "-t", "md5", "-k", "k", good});
  EXPECT_EQ(digestType.status, 2);
  EXPECT_THAT(digestType.err, HasSubstr("is a digest"));
}

TEST(ToolStrings, EncryptStringIsHexInWholeBlocksAndDecryptsBack) {
  ToolResult enc = RunTool({"encrypt-string", "-t", "twofish", "-k", "secret", "K\xc3\xb6ln, 17 bytes!!"});
  ASSERT_EQ(enc.status, 0) << enc.err;
  EXPECT_THAT(enc.out, MatchesRegex("[0-9a-f]{64}\n"));  // 18 UTF-8 bytes: two 16-byte blocks
  std::string hex = enc.out.substr(0, enc.out.size() - 1);
  ToolResult dec = RunTool({"decrypt-string", "-t", "9", "-k", "secret", hex});
  EXPECT_EQ(dec.status, 0) << dec.err;
  EXPECT_EQ(dec.out, "K\xc3\xb6ln, 17 bytes!!\n");
  ToolResult upper = RunTool({"decrypt-string", "-t", "twofish", "-k", "secret", "ABCDEF0123456789ABCDEF0123456789"});
  EXPECT_EQ(upper.status, 0);
}

TEST(ToolStrings, MalformedInputIsRefused) {
  for (const std::vector<std::string>& args : std::vector<std::vector<std::string>>{
           {"decrypt-string", "-t", "aes128", "-k", "k", "xyz0"},
           {"decrypt-string", "-t", "aes128", "-k", "k", "abc"},
           {"encrypt-string", "-t", "aes128", "-k", "k", ""},
       }) {
    ToolResult result = RunTool(args);
    EXPECT_EQ(result.status, 2) << args.back();
    EXPECT_THAT(result.err, HasSubstr("owutil: "));
  }
}

TEST(ToolSecretKey, MadeCodesVerifyForEveryEncTypeAndOnlyWithTheirKey) {
  for (int encType = 1; encType <= 11; ++encType) {
    std::string e = std::to_string(encType);
    ToolResult code = RunTool({"make-code", "-e", e, "--key-stdin"}, "my key\n");
    ASSERT_EQ(code.status, 0) << code.err;
    ASSERT_THAT(code.out, MatchesRegex("[0-9a-f]{64}\n"));
    std::string hex = code.out.substr(0, 64);
    ToolResult valid = RunTool({"verify-key", "-e", e, "-k", "my key", "-c", hex});
    EXPECT_EQ(valid.status, 0) << e << valid.err;
    EXPECT_EQ(valid.out, "valid\n");
    ToolResult wrongKey = RunTool({"verify-key", "-e", e, "-k", "my kez", "-c", hex});
    EXPECT_EQ(wrongKey.status, 1);
    EXPECT_EQ(wrongKey.out, "invalid\n");
    ToolResult wrongType = RunTool({"verify-key", "-e", std::to_string(encType % 11 + 1), "-k", "my key", "-c", hex});
    EXPECT_EQ(wrongType.status, 1);
  }
}

TEST(ToolSecretKey, UpperCaseCodeVerifiesAndShortCodeDoesNot) {
  ToolResult code = RunTool({"make-code", "-e", "9", "-k", "k"});
  std::string hex = code.out.substr(0, 64);
  std::string upper = hex;
  for (char& c : upper) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  ToolResult valid = RunTool({"verify-key", "-e", "9", "-k", "k", "-c", upper});
  EXPECT_EQ(valid.out, "valid\n");
  EXPECT_EQ(RunTool({"verify-key", "-e", "9", "-k", "k", "-c", hex.substr(0, 63)}).status, 1);
}

}  // namespace
}  // namespace OwTest
