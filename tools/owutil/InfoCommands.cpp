// Information commands: format-size, format-time, last-day, language, error-text, oem.
#include <climits>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "Cli.h"
#include "owutils/CString.h"
#include "owutils/LmFormat.h"
#include "owutils/LmOem.h"
#include "owutils/LmResources.h"

namespace owutil {
namespace {

int FormatSizeCommand(const std::string& bytes) {
  std::int64_t value = ParseInteger(bytes, "BYTES", INT64_MIN, INT64_MAX);
  PrintLine(CUtf8(FormatSize(value)));
  return 0;
}

int FormatTimeCommand(const std::string& seconds) {
  std::int64_t value = ParseInteger(seconds, "SECONDS", INT64_MIN, INT64_MAX);
  PrintLine(CUtf8(FormatTime(value)));
  return 0;
}

int LastDayCommand(const std::string& month, const std::string& year) {
  int m = static_cast<int>(ParseInteger(month, "MONTH", 1, 12));
  int y = static_cast<int>(ParseInteger(year, "YEAR", 1, 9999));
  PrintLine(std::to_string(GetLastDayOfMonth(m, y)));
  return 0;
}

int LanguageCommand() {
  PrintLine(std::to_string(GetLanguageId()) + " " + CUtf8(GetLanguageIdString()));
  return 0;
}

int ErrorTextCommand(const std::string& code) {
  std::int64_t value = ParseInteger(code, "CODE", INT32_MIN, UINT32_MAX);
  CString text;
  GetErrorMessage(static_cast<unsigned long>(static_cast<std::uint32_t>(value)), text);
  if (text.IsEmpty()) throw Failure("no message text for code " + code);
  PrintLine(CUtf8(text));
  return 0;
}

std::string JsonString(const std::string& text) {
  std::string out = "\"";
  for (unsigned char c : text) {
    switch (c) {
      case '"': out += "\\\""; break;
      case '\\': out += "\\\\"; break;
      case '\n': out += "\\n"; break;
      case '\r': out += "\\r"; break;
      case '\t': out += "\\t"; break;
      default:
        if (c < 0x20) {
          char escape[8];
          std::snprintf(escape, sizeof escape, "\\u%04x", c);
          out += escape;
        } else {
          out += static_cast<char>(c);
        }
    }
  }
  return out + "\"";
}

// A text field of the widened record, up to its terminator or its end.
std::string Field(const char16_t* text, size_t size) {
  size_t n = 0;
  while (n < size && text[n] != 0) ++n;
  return Utf8(Lumo::String(text, n));
}

struct OemField {
  std::string name;
  bool number;
  std::string value;
};

std::vector<OemField> OemFields(const LM_OEM_INFO& info) {
  std::vector<OemField> fields;
  auto number = [&](const char* name, std::uint32_t value) { fields.push_back({name, true, std::to_string(value)}); };
  auto text = [&](const char* name, const char16_t* value, size_t size) {
    fields.push_back({name, false, Field(value, size)});
  };
#define OW_TEXT_(field) text(#field, info.field, sizeof info.field / sizeof(char16_t))
  number("dwMajorVersion", info.dwMajorVersion);
  number("dwMinorVersion", info.dwMinorVersion);
  number("dwBuild", info.dwBuild);
  OW_TEXT_(szReportName);
  number("dwValue0", info.dwValue0);
  number("dwValue16", info.dwValue16);
  number("dwValue20", info.dwValue20);
  OW_TEXT_(szText24);
  OW_TEXT_(szText168);
  OW_TEXT_(szText296);
  OW_TEXT_(szText360);
  OW_TEXT_(szText424);
  OW_TEXT_(szText488);
  OW_TEXT_(szText520);
  OW_TEXT_(szText552);
  OW_TEXT_(szText584);
  for (int i = 0; i < 4; ++i)
    text(("aszText600[" + std::to_string(i) + "]").c_str(), info.aszText600[i], 16);
  OW_TEXT_(szText664);
  OW_TEXT_(szText920);
  OW_TEXT_(szText1176);
  OW_TEXT_(szText1688);
  OW_TEXT_(szText2200);
  OW_TEXT_(szText2712);
  number("byValue3224", info.byValue3224);
  OW_TEXT_(szText3225);
  OW_TEXT_(szText3737);
  OW_TEXT_(szText4249);
  number("byValue4761", info.byValue4761);
  number("byValue4762", info.byValue4762);
  number("dwValue4764", info.dwValue4764);
  number("dwValue4768", info.dwValue4768);
  number("dwValue4772", info.dwValue4772);
  number("byValue4776", info.byValue4776);
  number("byValue4777", info.byValue4777);
  OW_TEXT_(szEmailText0);
  OW_TEXT_(szEmailText100);
  OW_TEXT_(szEmailText175);
  number("dwEmailValue4271", info.dwEmailValue4271);
  OW_TEXT_(szEmailText4272);
  OW_TEXT_(szEmailText4304);
  number("dwEmailValue4336", info.dwEmailValue4336);
  number("dwEmailValue4340", info.dwEmailValue4340);
  number("dwEmailValue4344", info.dwEmailValue4344);
  number("dwEmailValue4348", info.dwEmailValue4348);
  OW_TEXT_(szEmailText4349);
  OW_TEXT_(szEmailText4861);
  OW_TEXT_(szEmailText5373);
#undef OW_TEXT_
  return fields;
}

int OemCommand(bool json) {
  auto info = std::make_unique<LM_OEM_INFO>();
  if (GetOEMDataTCHAR(info.get()) != 0) throw Failure("no OEM data: the engine resource module could not be loaded");
  std::vector<OemField> fields = OemFields(*info);
  if (json) {
    std::string out = "{";
    for (size_t i = 0; i < fields.size(); ++i) {
      out += (i == 0 ? "\n  " : ",\n  ") + JsonString(fields[i].name) + ": " +
             (fields[i].number ? fields[i].value : JsonString(fields[i].value));
    }
    PrintLine(out + "\n}");
  } else {
    PrintLine("version: " + fields[0].value + "." + fields[1].value + " build " + fields[2].value);
    for (size_t i = 3; i < fields.size(); ++i) {
      const OemField& field = fields[i];
      if (!field.number && field.value.empty()) continue;
      PrintLine(field.name + ": " + field.value);
    }
  }
  return 0;
}

}  // namespace

void AddInfoCommands(CLI::App& app, Commands& commands) {
  auto bytes = std::make_shared<std::string>();
  CLI::App* fs = app.add_subcommand("format-size", "a byte count as a short size text (KB, MB, GB)");
  fs->add_option("BYTES", *bytes, "a whole number, may be negative")->required();
  fs->footer("Example: owutil format-size 5368709120   prints 5.00 GB");
  commands.Bind(fs, [bytes] { return FormatSizeCommand(*bytes); });

  auto seconds = std::make_shared<std::string>();
  CLI::App* ft = app.add_subcommand("format-time", "seconds since 1970-01-01 UTC as the user's short date and time");
  ft->add_option("SECONDS", *seconds, "a whole number")->required();
  ft->footer("Example: owutil format-time 1700000000");
  commands.Bind(ft, [seconds] { return FormatTimeCommand(*seconds); });

  auto month = std::make_shared<std::string>(), year = std::make_shared<std::string>();
  CLI::App* ld = app.add_subcommand("last-day", "the number of days in a month");
  ld->add_option("MONTH", *month, "1-12")->required();
  ld->add_option("YEAR", *year, "1-9999")->required();
  ld->footer("Example: owutil last-day 2 2024   prints 29");
  commands.Bind(ld, [month, year] { return LastDayCommand(*month, *year); });

  CLI::App* lang = app.add_subcommand("language", "the user-interface language: identifier and code, as '1031 deu'");
  commands.Bind(lang, [] { return LanguageCommand(); });

  auto code = std::make_shared<std::string>();
  CLI::App* et = app.add_subcommand("error-text", "the message text of a code (message module, then the system)");
  et->add_option("CODE", *code, "decimal, or hex with 0x")->required();
  et->footer("Example: owutil error-text 5");
  commands.Bind(et, [code] { return ErrorTextCommand(*code); });

  auto json = std::make_shared<bool>(false);
  CLI::App* oem = app.add_subcommand("oem", "the OEM branding record of the engine resource module");
  oem->add_flag("--json", *json, "print it as a JSON object");
  commands.Bind(oem, [json] { return OemCommand(*json); });
}

}  // namespace owutil
