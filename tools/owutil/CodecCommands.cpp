// Codec commands: hex encode/decode and decimal (the bit and ASCII codecs, on UTF-8 bytes),
// uri encode/decode and special encode/decode (the transport encodings).
#include <cstdio>
#include <memory>
#include <vector>

#include "Cli.h"
#include "owutils/BitCodecs.h"
#include "owutils/Exceptions.h"
#include "owutils/StringEncodeDecode.h"

namespace owutil {
namespace {

int HexEncode(const std::string& text) {
  Wide(text, "TEXT");  // the bytes must be text
  std::vector<char> out(2 * text.size() + 1);
  int n = BitsToAscii(reinterpret_cast<const unsigned char*>(text.data()), static_cast<int>(text.size()), out.data());
  PrintLine(std::string(out.data(), static_cast<size_t>(n)));
  return 0;
}

int HexDecode(const std::string& hex) {
  if (!hex.empty() && !IsHexText(hex)) throw UsageError("HEX must be hexadecimal digits, not '" + hex + "'");
  if (hex.size() % 2 != 0) throw UsageError("HEX must have an even number of digits");
  std::vector<unsigned char> out(hex.size() / 2 + 1);
  unsigned int n = AsciiToBits(hex.data(), static_cast<unsigned int>(hex.size()), out.data());
  std::fwrite(out.data(), 1, n, stdout);
  std::fputc('\n', stdout);
  return 0;
}

int Decimal(const std::string& text) {
  Wide(text, "TEXT");
  std::vector<char> out(3 * text.size() + 1);
  int n = BitsToDecimal(reinterpret_cast<const unsigned char*>(text.data()), static_cast<int>(text.size()), out.data());
  PrintLine(std::string(out.data(), static_cast<size_t>(n)));
  return 0;
}

enum class Encoding { Uri, Special };

int Transcode(Encoding encoding, bool encode, const std::string& text) {
  Lumo::String input = Wide(text, "TEXT");
  try {
    Lumo::String result;
    if (encoding == Encoding::Uri)
      result = encode ? Lumo::EncodeURI(input.c_str()) : Lumo::DecodeURI(input.c_str());
    else
      result = encode ? Lumo::EncodeSpecialChars(input.c_str()) : Lumo::DecodeSpecialChars(input.c_str());
    PrintLine(Utf8(result));
  } catch (LumoException::Exception& e) {
    // The text form names the input and the precise cause; it ends with a line end.
    std::string message = Utf8(e.ToString());
    while (!message.empty() && (message.back() == '\n' || message.back() == '\r')) message.pop_back();
    throw UsageError(message);
  }
  return 0;
}

// Adds "GROUP encode TEXT" and "GROUP decode TEXT".
void AddPair(CLI::App& app, Commands& commands, const char* group, const char* what,
             std::function<int(bool, const std::string&)> run, const char* example) {
  CLI::App* parent = app.add_subcommand(group, std::string(what) + ": encode or decode TEXT");
  parent->require_subcommand(1);
  parent->footer(example);
  for (bool encode : {true, false}) {
    auto text = std::make_shared<std::string>();
    CLI::App* sub = parent->add_subcommand(encode ? "encode" : "decode", std::string(encode ? "encode" : "decode") +
                                                                            " TEXT (" + what + ")");
    sub->add_option("TEXT", *text, "the text")->required();
    commands.Bind(sub, [run, encode, text] { return run(encode, *text); });
  }
}

}  // namespace

void AddCodecCommands(CLI::App& app, Commands& commands) {
  AddPair(app, commands, "hex", "lower-case hex of the UTF-8 bytes",
          [](bool encode, const std::string& text) { return encode ? HexEncode(text) : HexDecode(text); },
          "Example: owutil hex encode 'K\xc3\xb6ln'   prints 4bc3b66c6e");

  auto decimal = std::make_shared<std::string>();
  CLI::App* dec = app.add_subcommand("decimal", "three decimal digits for each UTF-8 byte of TEXT");
  dec->add_option("TEXT", *decimal, "the text")->required();
  dec->footer("Example: owutil decimal AB   prints 065066");
  commands.Bind(dec, [decimal] { return Decimal(*decimal); });

  AddPair(app, commands, "uri", "URI percent-encoding of the UTF-8 bytes",
          [](bool encode, const std::string& text) { return Transcode(Encoding::Uri, encode, text); },
          "Example: owutil uri encode 'a b'   prints a%20b");
  AddPair(app, commands, "special", "percent-escapes of ASCII punctuation and control characters",
          [](bool encode, const std::string& text) { return Transcode(Encoding::Special, encode, text); },
          "Example: owutil special encode 'a/b c'   prints a%2Fb c");
}

}  // namespace owutil
