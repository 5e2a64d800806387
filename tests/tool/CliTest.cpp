// The command line itself: help, unknown commands and options, exit statuses, key options.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ToolRunner.h"
#include "support/TestEnvironment.h"

namespace OwTest {
namespace {

using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::Not;

const std::vector<std::vector<std::string>> kEveryCommand = {
    {"demo"},           {"types"},          {"digest"},         {"encrypt-file"}, {"decrypt-file"},
    {"encrypt-string"}, {"decrypt-string"}, {"make-code"},      {"verify-key"},   {"hex"},
    {"hex", "encode"},  {"hex", "decode"},  {"decimal"},        {"uri"},          {"uri", "encode"},
    {"uri", "decode"},  {"special"},        {"special", "encode"}, {"special", "decode"}, {"format-size"},
    {"format-time"},    {"last-day"},       {"language"},       {"error-text"},   {"oem"},
    {"eventlog"},       {"eventlog", "write"}, {"eventlog", "read"}, {"registry"}, {"registry", "get"},
    {"registry", "set"}, {"registry", "delete"},
};

TEST(ToolCli, EveryCommandHasHelp) {
  ToolResult top = RunTool({"--help"});
  EXPECT_EQ(top.status, 0);
  for (const auto& command : kEveryCommand) {
    if (command.size() == 1) {
      EXPECT_THAT(top.out, HasSubstr("  " + command[0] + " ")) << command[0];
    }
    std::vector<std::string> args = command;
    args.push_back("--help");
    ToolResult help = RunTool(args);
    EXPECT_EQ(help.status, 0) << command.back();
    EXPECT_THAT(help.out, HasSubstr("Usage: ")) << command.back();
    EXPECT_EQ(help.err, "") << command.back();
  }
}

TEST(ToolCli, BadCommandLinesExitWithTwoAndAMessage) {
  const std::vector<std::vector<std::string>> bad = {
      {},                                      // no command
      {"bogus"},                               // unknown command
      {"types", "--bogus"},                    // unknown option
      {"hex"},                                 // group without its subcommand
      {"encrypt-string", "-k", "x", "text"},   // missing -t
      {"last-day", "2"},                       // missing YEAR
      {"last-day", "13", "2024"},              // month out of range
      {"last-day", "two", "2024"},             // not a number
      {"format-size", "12kb"},
      {"error-text", "0xZZ"},
      {"digest", "-t", "aes128", "--string", "x"},  // a cipher is not a digest
      {"digest", "-t", "sha3", "--string", "x"},    // unknown type
      {"verify-key", "-e", "12", "-k", "k", "-c", "00"},
      {"verify-key", "-e", "0", "-k", "k", "-c", "00"},
  };
  for (const auto& args : bad) {
    ToolResult result = RunTool(args);
    std::string line;
    for (const auto& a : args) line += a + " ";
    EXPECT_EQ(result.status, 2) << line << "\n" << result.err;
    EXPECT_THAT(result.err, HasSubstr("owutil: ")) << line;
    EXPECT_EQ(result.out, "") << line;
  }
}

TEST(ToolCli, InvalidUtf8ArgumentIsBadInput) {
  ToolResult result = RunTool({"uri", "encode", "\xff\xfe"});
  EXPECT_EQ(result.status, 2);
  EXPECT_THAT(result.err, HasSubstr("not valid UTF-8"));
}

TEST(ToolCli, KeyOptionsAreExclusiveRequiredAndNeverEchoed) {
  const std::string key = "Sup3rSecretKeyText";
  std::string keyFile = WriteFile(MakeTempDirectory() + "/key.txt", key + "\n");
  const std::vector<ToolRun> runs = {
      {{"encrypt-string", "-t", "aes128", "-k", key, "-k", key, "x"}, "", {}, false},
      {{"encrypt-string", "-t", "aes128", "-k", key, "--key-file", keyFile, "x"}, "", {}, false},
      {{"encrypt-string", "-t", "aes128", "-k", key, "--key-stdin", "x"}, key + "\n", {}, false},
      {{"encrypt-string", "-t", "sha1", "-k", key, "x"}, "", {}, false},
      {{"encrypt-string", "-t", "bogus", "-k", key, "x"}, "", {}, false},
      {{"verify-key", "-e", "99", "-k", key, "-c", "00"}, "", {}, false},
      {{"verify-key", "-e", "9", "-k", key, "-c", "not-hex"}, "", {}, false},
  };
  for (const ToolRun& run : runs) {
    ToolResult result = RunTool(run);
    EXPECT_EQ(result.status, 2) << result.err;
    EXPECT_THAT(result.err, Not(HasSubstr(key)));
    EXPECT_THAT(result.out, Not(HasSubstr(key)));
  }
}

TEST(ToolCli, KeyIsRequiredAndMustNotBeEmpty) {
  std::string dir = MakeTempDirectory();
  const std::vector<ToolRun> runs = {
      {{"encrypt-string", "-t", "aes128", "x"}, "", {}, false},
      {{"encrypt-string", "-t", "aes128", "-k", "", "x"}, "", {}, false},
      {{"encrypt-string", "-t", "aes128", "--key-stdin", "x"}, "\n", {}, false},
      {{"encrypt-string", "-t", "aes128", "--key-file", WriteFile(dir + "/empty", ""), "x"}, "", {}, false},
      {{"encrypt-string", "-t", "aes128", "--key-file", dir + "/missing", "x"}, "", {}, false},
  };
  for (const ToolRun& run : runs) {
    ToolResult result = RunTool(run);
    EXPECT_EQ(result.status, 2) << result.err;
    EXPECT_THAT(result.err, AllOf(HasSubstr("owutil: "), HasSubstr("key")));
  }
}

}  // namespace
}  // namespace OwTest
