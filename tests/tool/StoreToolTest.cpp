// eventlog write/read and registry get/set/delete, against the stores in the test's sandbox.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "ToolRunner.h"
#include "support/TestEnvironment.h"

namespace OwTest {
namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using ::testing::StartsWith;

ToolResult Store(std::vector<std::string> args) {
  ToolRun run;
  run.args = std::move(args);
  run.env = WithLibraryDrive();  // the default message file lies beside the library
  return RunTool(run);
}

TEST(ToolEventLog, WrittenRecordsReadBackInBothDirectionsAndFromARecord) {
  ToolResult first = Store({"eventlog", "write", "--source", "Backup", "--type", "warning", "disk almost full", "D:"});
  ASSERT_EQ(first.status, 0) << first.err;
  EXPECT_EQ(first.out, "");
  ASSERT_EQ(Store({"eventlog", "write", "--source", "Restore", "--type", "1", "second"}).status, 0);
  ASSERT_EQ(Store({"eventlog", "write", "--source", "Backup", "third"}).status, 0);

  const std::string head = "\\[[A-Za-z]+ - [A-Z][a-z]{2} [A-Z][a-z]{2} [ 0-9]{2} [0-9:]{8} [0-9]{4} - ";
  ToolResult all = Store({"eventlog", "read"});
  ASSERT_EQ(all.status, 0) << all.err;
  EXPECT_THAT(all.out, MatchesRegex(head + "Warning\\]\ndisk almost full\nD:\n\n" + head + "Error\\]\nsecond\n\n" + head +
                                    "Information\\]\nthird\n\n"));
  EXPECT_THAT(all.out, StartsWith("[Backup - "));

  ToolResult newest = Store({"eventlog", "read", "--backwards", "--max", "1"});
  EXPECT_THAT(newest.out, MatchesRegex(head + "Information\\]\nthird\n\n"));
  ToolResult fromTwo = Store({"eventlog", "read", "--from", "2"});
  EXPECT_THAT(fromTwo.out, MatchesRegex(head + "Error\\]\nsecond\n\n" + head + "Information\\]\nthird\n\n"));
  EXPECT_EQ(Store({"eventlog", "read", "--log", "System"}).out, "");
}

TEST(ToolEventLog, BadInputIsRefused) {
  for (const std::vector<std::string>& args : std::vector<std::vector<std::string>>{
           {"eventlog", "write", "--source", "S", "--type", "fatal", "x"},
           {"eventlog", "write", "--source", "", "x"},
           {"eventlog", "write", "--source", "S", "--id", "-1", "x"},
           {"eventlog", "write", "--type", "error", "x"},  // no source
           {"eventlog", "read", "--log", "Setup"},
           {"eventlog", "read", "--max", "many"},
       }) {
    ToolResult result = Store(args);
    EXPECT_EQ(result.status, 2) << args[2] << " " << result.err;
    EXPECT_THAT(result.err, HasSubstr("owutil: "));
  }
}

TEST(ToolRegistry, SetGetAndDeleteValuesAndKeys) {
  const std::string key = "HKLM\\Software\\Orbis Works\\Orbis Works Orbis Agent";
  ToolResult set = Store({"registry", "set", key, "LanguageId", "0x407", "--type", "dword"});
  ASSERT_EQ(set.status, 0) << set.err;
  // Hive names long and short, keys and names without regard to case.
  EXPECT_EQ(Store({"registry", "get", "HKEY_LOCAL_MACHINE\\software\\orbis works\\Orbis Works Orbis Agent", "languageid"}).out,
            "1031\n");
  EXPECT_EQ(Store({"language"}).out, "1031 deu\n");  // the library reads the same store

  ASSERT_EQ(Store({"registry", "set", "HKCU\\A\\B", "Name", "K\xc3\xb6ln"}).status, 0);
  EXPECT_EQ(Store({"registry", "get", "HKEY_CURRENT_USER\\A\\B", "NAME"}).out, "K\xc3\xb6ln\n");
  ASSERT_EQ(Store({"registry", "set", "HKCU\\A\\B", "", "default"}).status, 0);
  EXPECT_EQ(Store({"registry", "get", "HKCU\\A\\B"}).out, "default\n");
  ASSERT_EQ(Store({"registry", "set", "HKCU\\A\\B", "N", "-1", "--type", "DWORD"}).status, 0);
  EXPECT_EQ(Store({"registry", "get", "HKCU\\A\\B", "N"}).out, "4294967295\n");

  ToolResult parent = Store({"registry", "delete", "HKCU\\A"});
  EXPECT_EQ(parent.status, 1);
  EXPECT_THAT(parent.err, HasSubstr("has subkeys"));
  EXPECT_EQ(Store({"registry", "delete", "HKCU\\A\\B", "Name"}).status, 0);
  ToolResult gone = Store({"registry", "get", "HKCU\\A\\B", "Name"});
  EXPECT_EQ(gone.status, 1);
  EXPECT_THAT(gone.err, HasSubstr("not found"));
  EXPECT_EQ(Store({"registry", "delete", "HKCU\\A\\B"}).status, 0);
  EXPECT_EQ(Store({"registry", "delete", "HKCU\\A"}).status, 0);
  EXPECT_EQ(Store({"registry", "get", "HKCU\\A"}).status, 1);
  EXPECT_EQ(Store({"registry", "delete", "HKCU\\A"}).status, 1);
}

TEST(ToolRegistry, BadInputIsRefused) {
  for (const std::vector<std::string>& args : std::vector<std::vector<std::string>>{
           {"registry", "get", "Software\\X", "V"},  // no hive
           {"registry", "get", "HKXX\\X", "V"},
           {"registry", "set", "HKCU\\X", "V", "12", "--type", "qword"},
           {"registry", "set", "HKCU\\X", "V", "0x100000000", "--type", "dword"},
           {"registry", "set", "HKCU\\X", "V", "ten", "--type", "dword"},
           {"registry", "set", "HKCU", "V", "1"},  // a value right in the hive
           {"registry", "delete", "HKLM"},
       }) {
    ToolResult result = Store(args);
    EXPECT_EQ(result.status, 2) << args[2] << " " << result.err;
    EXPECT_THAT(result.err, HasSubstr("owutil: "));
  }
}

}  // namespace
}  // namespace OwTest
