// hex, decimal, uri, special, format-size, format-time, last-day, language, error-text, oem,
// and the demo.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>

#include "ToolRunner.h"
#include "support/TestEnvironment.h"

namespace OwTest {
namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;

struct Case {
  std::vector<std::string> args;
  int status;
  std::string out;
};

void ExpectCases(const std::vector<Case>& cases) {
  for (const Case& c : cases) {
    ToolResult result = RunTool(c.args);
    std::string line;
    for (const auto& a : c.args) line += a + " ";
    EXPECT_EQ(result.status, c.status) << line << result.err;
    EXPECT_EQ(result.out, c.out) << line;
    if (c.status == 2) {
      EXPECT_THAT(result.err, HasSubstr("owutil: ")) << line;
    }
  }
}

TEST(ToolCodecs, HexAndDecimalWorkOnUtf8Bytes) {
  ExpectCases({
      {{"hex", "encode", "K\xc3\xb6ln"}, 0, "4bc3b66c6e\n"},
      {{"hex", "decode", "4BC3b66c6e"}, 0, "K\xc3\xb6ln\n"},
      {{"hex", "encode", ""}, 0, "\n"},
      {{"hex", "decode", "abc"}, 2, ""},   // odd number of digits
      {{"hex", "decode", "zz"}, 2, ""},    // not hex (the codec itself would read 0)
      {{"decimal", "AB\x07"}, 0, "065066007\n"},
      {{"decimal", "\xc3\xbf"}, 0, "195191\n"},
  });
}

TEST(ToolCodecs, UriAndSpecialEncodingsRoundTrip) {
  ExpectCases({
      {{"uri", "encode", "a b"}, 0, "a%20b\n"},
      {{"uri", "encode", "\xc3\xa9"}, 0, "%C3%A9\n"},
      {{"uri", "encode", "A-Z_a.z~0"}, 0, "A-Z_a.z~0\n"},
      {{"uri", "decode", "%c3%A9"}, 0, "\xc3\xa9\n"},
      {{"uri", "decode", "ab%"}, 0, "ab%\n"},
      {{"special", "encode", "a/b c"}, 0, "a%2Fb c\n"},
      {{"special", "encode", "\xc3\xbc!"}, 0, "\xc3\xbc%21\n"},
      {{"special", "decode", "a%2Fb"}, 0, "a/b\n"},
      {{"special", "decode", "x%"}, 0, "x%\n"},
  });
}

TEST(ToolCodecs, DecodingFailurePrintsTheExceptionAndExitsTwo) {
  ToolResult uri = RunTool({"uri", "decode", "%G0"});
  EXPECT_EQ(uri.status, 2);
  EXPECT_EQ(uri.out, "");
  EXPECT_THAT(uri.err, HasSubstr("exception LumoStringUnableToDecodeStringFromURI : Unable to decode URI string '%G0'."));
  EXPECT_THAT(uri.err, HasSubstr("caused by exception LumoStringInvalidHexCharA : 'G' is not a valid hexadecimal"));

  ToolResult special = RunTool({"special", "decode", "%41"});
  EXPECT_EQ(special.status, 2);
  EXPECT_THAT(special.err, HasSubstr("LumoStringUnableToDecodeSpecialCharsInString"));
  EXPECT_THAT(special.err, HasSubstr("LumoStringInvalidDecodedCharW"));
}

TEST(ToolInfo, FormatSizeTimeAndLastDay) {
  ExpectCases({
      {{"format-size", "0"}, 0, "0 KB\n"},
      {{"format-size", "1024"}, 0, "2 KB\n"},
      {{"format-size", "996148"}, 0, "0.95 MB\n"},
      {{"format-size", "5368709120"}, 0, "5.00 GB\n"},
      {{"format-size", "-5000"}, 0, "-4 KB\n"},  // a negative number is a value, not an option
      {{"format-size", "0x400"}, 0, "2 KB\n"},
      {{"format-size", "99999999999999999999"}, 2, ""},
      {{"format-time", "0"}, 0, "\n"},
      {{"last-day", "2", "2024"}, 0, "29\n"},
      {{"last-day", "2", "2023"}, 0, "28\n"},
      {{"last-day", "4", "2023"}, 0, "30\n"},
      {{"last-day", "0", "2023"}, 2, ""},
  });
}

TEST(ToolInfo, FormatTimeFollowsTheLocaleAndTimeZone) {
  ToolRun run;
  run.args = {"format-time", "1700000000"};
  run.env = {{"TZ", "UTC"}, {"LANG", "de_DE.UTF-8"}, {"LC_ALL", ""}, {"LC_TIME", ""}};
  ToolResult german = RunTool(run);
  EXPECT_EQ(german.status, 0) << german.err;
  EXPECT_EQ(german.out, "14.11.2023 22:13:20\n");
}

TEST(ToolInfo, LanguageAndErrorText) {
  ToolRun run;
  run.args = {"language"};
  run.env = {{"LANG", "de_DE.UTF-8"}, {"LC_ALL", ""}, {"LC_MESSAGES", ""}};
  ToolResult german = RunTool(run);
  EXPECT_EQ(german.status, 0) << german.err;
  EXPECT_EQ(german.out, "1031 deu\n");
  run.env["LANG"] = "C";
  EXPECT_THAT(RunTool(run).out, MatchesRegex("[0-9]+ [a-z]{3}\n"));

  auto error = [](const std::string& code) {
    ToolRun text;
    text.args = {"error-text", code};
    text.env = WithLibraryDrive();
    return RunTool(text);
  };
  ToolResult message = error("0xE0001001");
  EXPECT_EQ(message.status, 0) << message.err;
  EXPECT_THAT(message.out, MatchesRegex("The backup destination %1 cannot be reached\\.Check[^\n]*\n"));  // one line
  ToolResult system = error("5");
  EXPECT_EQ(system.status, 0);
  EXPECT_EQ(system.out, "Access is denied.\n");
  ToolResult none = error("0x7FFFFFF0");
  EXPECT_EQ(none.status, 1);
  EXPECT_THAT(none.err, HasSubstr("no message text"));
}

TEST(ToolInfo, OemRecordAsTextAndJson) {
  ToolRun run;
  run.args = {"oem"};
  run.env = WithLibraryDrive();
  ToolResult text = RunTool(run);
  ASSERT_EQ(text.status, 0) << text.err;
  EXPECT_THAT(text.out, MatchesRegex("version: [0-9]+\\.[0-9]+ build [0-9]+\n(.|\n)*"));
  EXPECT_THAT(text.out, HasSubstr("\nszReportName: "));
  run.args.push_back("--json");
  ToolResult json = RunTool(run);
  ASSERT_EQ(json.status, 0);
  EXPECT_THAT(json.out, MatchesRegex("\\{\n  \"dwMajorVersion\": [0-9]+,\n(.|\n)*\n\\}\n"));
  EXPECT_THAT(json.out, HasSubstr("\"szReportName\": \""));
  EXPECT_THAT(json.out, HasSubstr("\"szEmailText5373\": "));
}

TEST(ToolDemo, RunsEveryStepInASandboxAndCleansUp) {
  std::string tmp = MakeTempDirectory("tmp");
  ToolRun run;
  run.args = {"demo"};
  run.env = {{"TMPDIR", tmp}};
  ToolResult result = RunTool(run);
  EXPECT_EQ(result.status, 0) << result.out << result.err;
  EXPECT_THAT(result.out, HasSubstr("OWUTILS_STATE_DIR=" + tmp));
  EXPECT_THAT(result.out, HasSubstr("demo finished: every step passed"));
  EXPECT_THAT(result.out, ::testing::Not(HasSubstr("FAILED")));
  EXPECT_TRUE(std::filesystem::is_empty(tmp));  // the sandbox is gone
}

}  // namespace
}  // namespace OwTest
