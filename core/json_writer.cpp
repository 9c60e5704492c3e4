// The two layouts of the program's JSON files, as Json::StyledWriter and Json::FastWriter define them. Those build the
// whole text in memory, the first one from a copy of each array besides; these hand it on in pieces.
#include <json/writer.h>

#include <array>
#include <vector>

#include "core/json.h"

namespace {

constexpr size_t kPiece = size_t{64} << 10;

// Which bytes stand in a quoted text as they are.
constexpr std::array<bool, 256> kIsPlain = [] {
  std::array<bool, 256> plain{};
  for (size_t c = 0x20; c < 0x80; ++c)
    plain[c] = c != '"' && c != '\\';
  return plain;
}();

// Takes the character outside ASCII off the front of `text`; 0 when the bytes are no well-formed UTF-8.
uint32_t TakeCodepoint(std::string_view& text) {
  constexpr struct {
    unsigned char mask, lead;
    uint32_t least;
  } kLengths[] = {{0xE0, 0xC0, 0x80}, {0xF0, 0xE0, 0x800}, {0xF8, 0xF0, 0x10000}};
  const auto first = static_cast<unsigned char>(text.front());
  for (size_t following = 1; following <= std::size(kLengths); ++following) {
    const auto& length = kLengths[following - 1];
    if ((first & length.mask) != length.lead) continue;
    if (text.size() <= following) return 0;
    uint32_t codepoint = first & static_cast<unsigned char>(~length.mask);
    for (size_t i = 1; i <= following; ++i) {
      const auto next = static_cast<unsigned char>(text[i]);
      if ((next & 0xC0) != 0x80) return 0;
      codepoint = codepoint << 6 | (next & 0x3F);
    }
    const bool isSurrogate = codepoint >= 0xD800 && codepoint <= 0xDFFF;
    if (codepoint < length.least || codepoint > 0x10FFFF || isSurrogate) return 0;
    text.remove_prefix(following + 1);
    return codepoint;
  }
  return 0;
}

void AppendHex(std::string& out, uint32_t unit) {
  constexpr char kDigits[] = "0123456789abcdef";
  const char escape[] = {
      '\\', 'u', kDigits[unit >> 12 & 15], kDigits[unit >> 8 & 15], kDigits[unit >> 4 & 15], kDigits[unit & 15]};
  out.append(escape, sizeof escape);
}

void AppendEscaped(std::string& out, unsigned char c) {
  constexpr std::string_view kNamed = "\"\\\b\f\n\r\t";
  constexpr std::string_view kLetters = "\"\\bfnrt";
  const size_t index = kNamed.find(static_cast<char>(c));
  if (index == std::string_view::npos) return AppendHex(out, c);
  out += '\\';
  out += kLetters[index];
}

void AppendQuoted(std::string& out, std::string_view text) {
  const size_t begin = out.size();
  std::string_view rest = text;
  out += '"';
  while (!rest.empty()) {
    size_t plain = 0;
    while (plain < rest.size() && kIsPlain[static_cast<unsigned char>(rest[plain])])
      ++plain;
    out.append(rest.data(), plain);
    rest.remove_prefix(plain);
    if (rest.empty()) break;
    if (static_cast<unsigned char>(rest.front()) < 0x80) {
      AppendEscaped(out, static_cast<unsigned char>(rest.front()));
      rest.remove_prefix(1);
    } else if (const uint32_t codepoint = TakeCodepoint(rest); codepoint >= 0x10000) {
      AppendHex(out, 0xD800 + ((codepoint - 0x10000) >> 10));
      AppendHex(out, 0xDC00 + (codepoint & 0x3FF));
    } else if (codepoint != 0) {
      AppendHex(out, codepoint);
    } else {  // what the library makes of ill-formed text is its own
      out.resize(begin);
      out += Json::valueToQuotedString(text.data(), text.size());
      return;
    }
  }
  out += '"';
}

}  // namespace

void AppendJsonScalar(std::string& out, const Json::Value& value) {
  const char* begin = nullptr;
  const char* end = nullptr;
  switch (value.type()) {
    case Json::nullValue:
      out += "null";
      break;
    case Json::intValue:
      out += Json::valueToString(value.asLargestInt());
      break;
    case Json::uintValue:
      out += Json::valueToString(value.asLargestUInt());
      break;
    case Json::realValue:
      out += Json::valueToString(value.asDouble());
      break;
    case Json::booleanValue:
      out += value.asBool() ? "true" : "false";
      break;
    case Json::stringValue:
      if (value.getString(&begin, &end)) AppendQuoted(out, {begin, static_cast<size_t>(end - begin)});
      break;
    case Json::arrayValue:
    case Json::objectValue:
      break;
  }
}

namespace {

bool IsFilledContainer(const Json::Value& value) {
  return (value.isArray() || value.isObject()) && !value.empty();
}

// Calls `each(element, isFirst)` until it returns false. An element that was never set is null.
template <class Function>
void ForEachElement(const Json::Value& array, Function each) {
  auto element = array.begin();
  const Json::ArrayIndex size = array.size();
  for (Json::ArrayIndex index = 0; index < size; ++index) {
    const bool isSet = element != array.end() && element.index() == index;
    if (!each(isSet ? *element : Json::Value::nullSingleton(), index == 0)) return;
    if (isSet) ++element;
  }
}

// What both layouts share: the text on its way to the sink.
class JsonText {
 public:
  explicit JsonText(const JsonSink& sink) : m_sink(sink) {}
  JsonText(const JsonText&) = delete;
  JsonText& operator=(const JsonText&) = delete;

  void Write(const Json::Value& root) {
    Put(root);
    m_text += '\n';
    PassOn(0);
  }

 protected:
  ~JsonText() = default;

  virtual void Put(const Json::Value& value) = 0;

  // False once the sink has had enough.
  bool PassOn(size_t least = kPiece) {
    if (m_text.size() < least) return m_wanted;
    if (m_wanted) m_wanted = m_sink(m_text);
    m_text.clear();
    return m_wanted;
  }

  void PutMemberName(const Json::ValueConstIterator& member) {
    const char* end = nullptr;
    const char* begin = member.memberName(&end);
    AppendQuoted(m_text, {begin, static_cast<size_t>(end - begin)});
  }

  // Containers without content look the same in both layouts.
  void PutScalarOrEmpty(std::string& out, const Json::Value& value) {
    if (value.isArray()) {
      out += "[]";
    } else if (value.isObject()) {
      out += "{}";
    } else {
      AppendJsonScalar(out, value);
    }
  }

  std::string m_text;

 private:
  const JsonSink& m_sink;
  bool m_wanted = true;
};

// NOLINTBEGIN(misc-no-recursion): as deep as the document, which is bounded where it is made

class CompactText final : public JsonText {
 public:
  using JsonText::JsonText;

 private:
  void Put(const Json::Value& value) override {
    if (!IsFilledContainer(value)) {
      PutScalarOrEmpty(m_text, value);
    } else if (value.isArray()) {
      ForEachElement(value, [this](const Json::Value& element, bool isFirst) {
        m_text += isFirst ? '[' : ',';
        Put(element);
        return PassOn();
      });
      m_text += ']';
    } else {
      PutObject(value);
    }
  }

  void PutObject(const Json::Value& value) {
    char before = '{';
    for (auto member = value.begin(); member != value.end() && PassOn(); ++member) {
      m_text += before;
      PutMemberName(member);
      m_text += ':';
      Put(*member);
      before = ',';
    }
    m_text += '}';
  }
};

class StyledText final : public JsonText {
 public:
  using JsonText::JsonText;

 private:
  static constexpr size_t kIndent = 3;
  static constexpr size_t kRightMargin = 74;

  void Put(const Json::Value& value) override {
    if (!IsFilledContainer(value)) {
      PutScalarOrEmpty(m_text, value);
    } else if (value.isArray()) {
      if (!PutLine(value)) PutLines(value);
    } else {
      PutObject(value);
    }
  }

  void PutObject(const Json::Value& value) {
    m_text += '{';
    m_indent += kIndent;
    bool isFirst = true;
    for (auto member = value.begin(); member != value.end() && PassOn(); ++member) {
      if (!isFirst) m_text += ',';
      isFirst = false;
      BeginLine();
      PutMemberName(member);
      m_text += " : ";
      Put(*member);
    }
    m_indent -= kIndent;
    BeginLine();
    m_text += '}';
  }

  // An array in one line, when all its elements are simple and fit in front of the margin, wherever it begins.
  bool PutLine(const Json::Value& array) {
    if (size_t{array.size()} * 3 >= kRightMargin) return false;
    bool fits = true;
    m_line.clear();
    ForEachElement(array, [this, &fits](const Json::Value& element, bool isFirst) {
      m_line += isFirst ? "[ " : ", ";
      fits = !IsFilledContainer(element);
      if (fits) PutScalarOrEmpty(m_line, element);
      fits = fits && m_line.size() + 2 < kRightMargin;
      return fits;
    });
    if (fits) m_text.append(m_line).append(" ]");
    return fits;
  }

  void PutLines(const Json::Value& array) {
    m_text += '[';
    m_indent += kIndent;
    ForEachElement(array, [this](const Json::Value& element, bool isFirst) {
      if (!isFirst) m_text += ',';
      BeginLine();
      Put(element);
      return PassOn();
    });
    m_indent -= kIndent;
    BeginLine();
    m_text += ']';
  }

  void BeginLine() {
    m_text += '\n';
    m_text.append(m_indent, ' ');
  }

  size_t m_indent = 0;
  std::string m_line;
};

// NOLINTEND(misc-no-recursion)

template <class Text>
std::string WholeText(const Json::Value& value) {
  std::string whole;
  const JsonSink append = [&whole](std::string_view piece) {
    whole += piece;
    return true;
  };
  Text(append).Write(value);
  return whole;
}

}  // namespace

void WriteStyledJson(const Json::Value& value, const JsonSink& sink) {
  StyledText(sink).Write(value);
}

void WriteCompactJson(const Json::Value& value, const JsonSink& sink) {
  CompactText(sink).Write(value);
}

std::string WriteStyledJson(const Json::Value& value) {
  return WholeText<StyledText>(value);
}

std::string WriteCompactJson(const Json::Value& value) {
  return WholeText<CompactText>(value);
}
