// The XML exchange form of exceptions: ToXml and RemoteException.
//
// RapidXml is used in its UTF-8 form. Its 16-bit form classifies a character by the low byte
// only, so U+013C would be taken for '<' and U+0126 for '&'; the 8-bit tables are exact for
// UTF-8, where every byte of a multi-byte sequence is 0x80 or above. Text is converted at the
// edges, so callers still hand out and accept UTF-16.
#include "owutils/RemoteException.h"

#include <rapidxml.hpp>
#include <rapidxml_print.hpp>

#include <climits>
#include <cstring>
#include <iterator>
#include <string>

#include "owutils/StringEncodeDecode.h"

namespace LumoException {
namespace {

using XmlDocument = rapidxml::xml_document<char>;
using XmlNode = rapidxml::xml_node<char>;
using XmlAttribute = rapidxml::xml_attribute<char>;

// RapidXml parses recursively, one level of its own call stack per level of element nesting.
// Text nested deeper than this is refused before parsing, so that no input can exhaust the stack
// of whichever thread reads it. A chain of kMaxChainDepth exceptions needs about 67 levels.
constexpr int kMaxParseNesting = 256;

// --- Writing ---------------------------------------------------------------------------------

const char* PoolCopy(XmlDocument& doc, const Lumo::String& text) {
  return doc.allocate_string(Lumo::WideToUtf8(text.c_str()).c_str());
}

const char* PoolNumber(XmlDocument& doc, std::int32_t value) {
  return doc.allocate_string(std::to_string(value).c_str());
}

void AddAttribute(XmlDocument& doc, XmlNode* node, const char* name, const char* value) {
  node->append_attribute(doc.allocate_attribute(name, value));
}

XmlNode* BuildElement(XmlDocument& doc, const Exception& e) {
  const ExceptionType& type = e.GetType();
  XmlNode* element = doc.allocate_node(rapidxml::node_element, "exception");
  AddAttribute(doc, element, "name", PoolCopy(doc, type.name != nullptr ? type.name : u""));
  AddAttribute(doc, element, "module", PoolCopy(doc, type.module != nullptr ? type.module : u""));
  AddAttribute(doc, element, "code", PoolNumber(doc, type.code));

  element->append_node(doc.allocate_node(rapidxml::node_element, "message", PoolCopy(doc, e.GetMessage())));
  if (!e.GetUserMessage().empty()) {
    element->append_node(
        doc.allocate_node(rapidxml::node_element, "usermessage", PoolCopy(doc, e.GetUserMessage())));
  }
  XmlNode* history = doc.allocate_node(rapidxml::node_element, "history");
  for (const ExceptionEvent& event : e.GetHistory()) {  // newest first, as stored
    XmlNode* entry = doc.allocate_node(rapidxml::node_element, "event");
    AddAttribute(doc, entry, "type", PoolNumber(doc, event.kind));
    AddAttribute(doc, entry, "filename", PoolCopy(doc, event.file));
    AddAttribute(doc, entry, "linenumber", PoolNumber(doc, event.line));
    history->append_node(entry);
  }
  element->append_node(history);
  return element;
}

// --- Reading ---------------------------------------------------------------------------------

Lumo::String FromUtf8(const char* text, size_t size) {
  return Lumo::Utf8ToWide(std::string(text, size).c_str());
}

std::unique_ptr<char16_t[]> DuplicateFromUtf8(const char* text, size_t size) {
  const Lumo::String wide = FromUtf8(text, size);
  std::unique_ptr<char16_t[]> copy(new char16_t[wide.size() + 1]);
  std::memcpy(copy.get(), wide.c_str(), (wide.size() + 1) * sizeof(char16_t));
  return copy;
}

// The leading integer of `text` as the runtime's atoi reads it: optional white space and sign,
// then decimal digits up to the first other character; 0 without digits; clamped on overflow.
std::int32_t ToInt(const char* text, size_t size) {
  size_t i = 0;
  while (i < size && (text[i] == ' ' || (text[i] >= '\t' && text[i] <= '\r'))) ++i;
  bool negative = false;
  if (i < size && (text[i] == '+' || text[i] == '-')) negative = text[i++] == '-';
  long long value = 0;
  for (; i < size && text[i] >= '0' && text[i] <= '9'; ++i) {
    value = value * 10 + (text[i] - '0');
    if (value > static_cast<long long>(INT_MAX) + 1) break;
  }
  if (negative) value = -value;
  if (value > INT_MAX) return INT_MAX;
  if (value < INT_MIN) return INT_MIN;
  return static_cast<std::int32_t>(value);
}

bool NameIs(const XmlNode* node, const char* name) {
  const size_t length = std::strlen(name);
  return node->name_size() == length && std::memcmp(node->name(), name, length) == 0;
}
bool NameIs(const XmlAttribute* attribute, const char* name) {
  const size_t length = std::strlen(name);
  return attribute->name_size() == length && std::memcmp(attribute->name(), name, length) == 0;
}

// The text of a value element (`message`, `usermessage`). RapidXml drops content made only of
// white space, which would turn a message of blanks into an empty one; that content is taken
// from the parsed text itself, which is parsed without in-place terminators and so still holds
// the start tag and the white space after it as they were written.
std::string ElementText(const XmlNode* node) {
  if (node->value_size() != 0 || node->first_node() != nullptr) return std::string(node->value(), node->value_size());
  const char* p = node->name() + node->name_size();
  char previous = 0;
  while (*p != 0 && *p != '>') {
    if (*p == '"' || *p == '\'') {
      const char quote = *p++;
      while (*p != 0 && *p != quote) ++p;
      if (*p == 0) return {};
    }
    previous = *p++;
  }
  if (*p != '>' || previous == '/') return {};
  const char* start = ++p;
  while (*p == ' ' || *p == '\t' || *p == '\r' || *p == '\n') ++p;
  return *p == '<' ? std::string(start, p) : std::string();
}

// Skips a quoted attribute value starting at text[i] (the quote). Returns the index after it.
size_t SkipQuoted(const std::string& text, size_t i) {
  const char quote = text[i];
  const size_t end = text.find(quote, i + 1);
  return end == std::string::npos ? text.size() : end + 1;
}

// The deepest element nesting of `text`, counted the way RapidXml will recurse over it, or
// stopping early once `limit` is passed. Markup that is not an element (comments, CDATA,
// declarations, processing instructions) does not nest.
int ElementNesting(const std::string& text, int limit) {
  int depth = 0;
  int deepest = 0;
  size_t i = 0;
  const size_t n = text.size();
  auto skipPast = [&](size_t from, const char* terminator) {
    const size_t end = text.find(terminator, from);
    return end == std::string::npos ? n : end + std::strlen(terminator);
  };
  while (i < n) {
    if (text[i] != '<') {
      ++i;
      continue;
    }
    if (text.compare(i, 4, "<!--") == 0) {
      i = skipPast(i + 4, "-->");
    } else if (text.compare(i, 9, "<![CDATA[") == 0) {
      i = skipPast(i + 9, "]]>");
    } else if (text.compare(i, 2, "<?") == 0) {
      i = skipPast(i + 2, "?>");
    } else if (text.compare(i, 2, "<!") == 0) {
      // A declaration; its internal subset may hold further declarations, none of them nests.
      i += 2;
      while (i < n && text[i] != '>') i = (text[i] == '"' || text[i] == '\'') ? SkipQuoted(text, i) : i + 1;
      ++i;
    } else if (text.compare(i, 2, "</") == 0) {
      --depth;
      i = skipPast(i + 2, ">");
    } else {
      // An element start tag: find its end outside quoted attribute values.
      bool selfClosing = false;
      ++i;
      while (i < n && text[i] != '>') {
        if (text[i] == '"' || text[i] == '\'') {
          i = SkipQuoted(text, i);
          continue;
        }
        selfClosing = text[i] == '/';
        ++i;
      }
      ++i;
      if (!selfClosing && ++depth > deepest) {
        deepest = depth;
        if (deepest > limit) break;
      }
    }
  }
  return deepest;
}

}  // namespace

// --- ToXml -----------------------------------------------------------------------------------

Lumo::String ToXml(const Exception& e) {
  std::string printed;
  try {
    XmlDocument doc;
    XmlNode* root = BuildElement(doc, e);
    XmlNode* parent = root;
    for (const Exception* cause = e.GetCause(); cause != nullptr; cause = cause->GetCause()) {
      XmlNode* element = BuildElement(doc, *cause);
      parent->append_node(element);
      parent = element;
    }
    rapidxml::print(std::back_inserter(printed), *root, 0);
  } catch (...) {
    // Keep whatever was printed before the failure.
  }
  try {
    return Lumo::Utf8ToWide(printed.c_str());
  } catch (...) {
    return Lumo::String();
  }
}

// --- RemoteException -------------------------------------------------------------------------

const ExceptionType& RemoteException::StaticType() {
  static constexpr ExceptionType type{u"", u"RemoteException", 0};
  return type;
}

RemoteException::RemoteException(EmptyTag) : Exception(u"") {}

RemoteException::RemoteException(const Lumo::String& xml) : Exception(xml.c_str()) {
  try {
    Lumo::String text(xml);
    if (!text.empty() && text.front() == u'\uFEFF') text.erase(0, 1);
    // A private copy for RapidXml's destructive parsing; the caller's text stays as it is.
    std::string utf8 = Lumo::WideToUtf8(text.c_str());
    if (ElementNesting(utf8, kMaxParseNesting) > kMaxParseNesting) return;

    XmlDocument doc;
    doc.parse<rapidxml::parse_no_string_terminators>(utf8.data());
    const XmlNode* element = doc.first_node("exception");
    if (element == nullptr) return;
    ReadElement(*element, 1);
  } catch (...) {
    // Unreadable text: keep what was set so far (at least the raw text as the message).
  }
}

template <typename Node>
void RemoteException::ReadElement(const Node& element, int depth) {
  for (const XmlAttribute* a = element.first_attribute(); a != nullptr; a = a->next_attribute()) {
    if (NameIs(a, "name")) {
      m_pName = DuplicateFromUtf8(a->value(), a->value_size());
    } else if (NameIs(a, "module")) {
      m_pModule = DuplicateFromUtf8(a->value(), a->value_size());
    } else if (NameIs(a, "code")) {
      m_code = ToInt(a->value(), a->value_size());
    }
  }
  UpdateType();

  for (const XmlNode* child = element.first_node(); child != nullptr; child = child->next_sibling()) {
    if (child->type() != rapidxml::node_element) continue;
    if (NameIs(child, "history")) {
      for (const XmlNode* entry = child->first_node(); entry != nullptr; entry = entry->next_sibling()) {
        if (entry->type() != rapidxml::node_element) continue;
        ExceptionEvent event{Lumo::String(), -1, Thrown};
        for (const XmlAttribute* a = entry->first_attribute(); a != nullptr; a = a->next_attribute()) {
          if (NameIs(a, "filename")) {
            event.file = FromUtf8(a->value(), a->value_size());
          } else if (NameIs(a, "linenumber")) {
            event.line = ToInt(a->value(), a->value_size());
          } else if (NameIs(a, "type")) {
            event.kind = ToInt(a->value(), a->value_size());
          }
        }
        AppendHistoryEvent(event);
      }
    } else if (NameIs(child, "message")) {
      const std::string value = ElementText(child);
      SetMessage(FromUtf8(value.data(), value.size()).c_str());
    } else if (NameIs(child, "usermessage")) {
      const std::string value = ElementText(child);
      SetUserMessage(FromUtf8(value.data(), value.size()).c_str());
    } else if (NameIs(child, "exception")) {
      // One cause only, and no deeper than the chain limit: the rest is ignored.
      if (GetCause() != nullptr || IsPostCloned() || depth >= kMaxChainDepth) continue;
      auto* cause = new RemoteException(EmptyTag{});
      AdoptCause(cause);
      cause->ReadElement(*child, depth + 1);
    }
  }
}

RemoteException::RemoteException(RemoteException&& other)
    : Exception(std::move(other)),
      m_pModule(std::move(other.m_pModule)),
      m_pName(std::move(other.m_pName)),
      m_code(other.m_code) {
  UpdateType();
  other.UpdateType();
}

void RemoteException::UpdateType() noexcept {
  m_type = m_pName ? ExceptionType{m_pModule ? m_pModule.get() : u"", m_pName.get(), m_code} : StaticType();
}

RemoteException::~RemoteException() = default;

const ExceptionType& RemoteException::GetType() const { return m_type; }

void RemoteException::Throw(const char16_t* file, int line) {
  RecordThrow(file, line);
  throw RemoteException(std::move(*this));
}

RemoteException* RemoteException::Clone() { return new RemoteException(std::move(*this)); }

}  // namespace LumoException
