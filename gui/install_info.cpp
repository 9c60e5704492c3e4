#include "gui/install_info.h"

#include <yaml.h>

#include <memory>
#include <new>
#include <stdexcept>
#include <string>

#include "core/text.h"

namespace qx {
namespace {

constexpr size_t kMostLevels = 100;
constexpr size_t kMostValues = 50'000;
constexpr size_t kMostAnchors = 1000;
constexpr size_t kMostMembers = 4096;  // of one mapping: looking one up is a linear search

class Parser {
 public:
  explicit Parser(std::string_view text) {
    if (yaml_parser_initialize(&m_parser) == 0) throw std::bad_alloc();
    yaml_parser_set_input_string(&m_parser, reinterpret_cast<const unsigned char*>(text.data()), text.size());
  }
  ~Parser() { yaml_parser_delete(&m_parser); }
  Parser(const Parser&) = delete;
  Parser& operator=(const Parser&) = delete;

  yaml_parser_t* Get() { return &m_parser; }

  std::string Problem() const {
    const char* const text = m_parser.problem == nullptr ? "not a YAML document" : m_parser.problem;
    return std::string(text) + " in line " + std::to_string(m_parser.problem_mark.line + 1);
  }

 private:
  yaml_parser_t m_parser{};
};

// The parser itself sets no limits, and its work grows with the square of the depth and of the number of anchors: a
// first pass over the events, which keeps nothing, ends before either becomes long.
class Inspection {
 public:
  explicit Inspection(std::string_view text) : m_parser(text) {}

  void Run() {
    for (bool isEnd = false; !isEnd;) {
      yaml_event_t event{};
      if (yaml_parser_parse(m_parser.Get(), &event) == 0) throw std::runtime_error(m_parser.Problem());
      const std::unique_ptr<yaml_event_t, EventRelease> owner(&event);
      isEnd = event.type == YAML_STREAM_END_EVENT || event.type == YAML_DOCUMENT_END_EVENT;
      Count(event);
    }
  }

 private:
  struct EventRelease {
    void operator()(yaml_event_t* event) const { yaml_event_delete(event); }
  };

  void Count(const yaml_event_t& event) {
    switch (event.type) {
      case YAML_SCALAR_EVENT:
        return CountAnchor(event.data.scalar.anchor);
      case YAML_SEQUENCE_START_EVENT:
        CountAnchor(event.data.sequence_start.anchor);
        return Enter();
      case YAML_MAPPING_START_EVENT:
        CountAnchor(event.data.mapping_start.anchor);
        return Enter();
      case YAML_SEQUENCE_END_EVENT:
      case YAML_MAPPING_END_EVENT:
        --m_level;
        return;
      default:
        return;
    }
  }
  void CountAnchor(const yaml_char_t* anchor) {
    if (anchor != nullptr && ++m_anchors > kMostAnchors) throw std::runtime_error("too many anchors");
  }
  void Enter() {
    if (++m_level > kMostLevels) throw std::runtime_error("nested too deeply");
  }

  Parser m_parser;
  size_t m_level = 0;
  size_t m_anchors = 0;
};

struct DocumentRelease {
  void operator()(yaml_document_t* document) const { yaml_document_delete(document); }
};

class Converter {
 public:
  explicit Converter(yaml_document_t& document) : m_document(document) {}

  Value Convert(int index, size_t level = 0) {
    if (level > kMostLevels) throw std::runtime_error("a value contains itself");
    if (++m_values > kMostValues) throw std::runtime_error("too many values");
    const yaml_node_t* const node = yaml_document_get_node(&m_document, index);
    if (node == nullptr) return {};
    switch (node->type) {
      case YAML_SCALAR_NODE:
        return Text(*node);
      case YAML_SEQUENCE_NODE:
        return Sequence(*node, level);
      case YAML_MAPPING_NODE:
        return Mapping(*node, level);
      default:
        return {};
    }
  }

 private:
  std::wstring Text(const yaml_node_t& node) {
    // The scalar that an alias stands for counts each time: a few of them could fill the memory.
    m_bytes += node.data.scalar.length;
    if (m_bytes > 2 * kLargestInstallInfo) throw std::runtime_error("too much text");
    return ToWide({reinterpret_cast<const char*>(node.data.scalar.value), node.data.scalar.length});
  }
  Value Sequence(const yaml_node_t& node, size_t level) {
    Value array = Value::EmptyArray();
    for (const int* item = node.data.sequence.items.start; item < node.data.sequence.items.top; ++item) {
      array.Append(Convert(*item, level + 1));
    }
    return array;
  }
  Value Mapping(const yaml_node_t& node, size_t level) {
    Value object = Value::EmptyObject();
    const auto& pairs = node.data.mapping.pairs;
    if (static_cast<size_t>(pairs.top - pairs.start) > kMostMembers) {
      throw std::runtime_error("too many members in one mapping");
    }
    for (const yaml_node_pair_t* pair = pairs.start; pair < pairs.top; ++pair) {
      const yaml_node_t* const key = yaml_document_get_node(&m_document, pair->key);
      if (key == nullptr || key->type != YAML_SCALAR_NODE) continue;
      object.SetMember(Text(*key), Convert(pair->value, level + 1));
    }
    return object;
  }

  yaml_document_t& m_document;
  size_t m_values = 0;
  size_t m_bytes = 0;
};

}  // namespace

bool ParseYaml(std::string_view text, Value& value, std::string& error) {
  value = Value();
  try {
    Inspection(text).Run();
    Parser parser(text);
    yaml_document_t document{};
    if (yaml_parser_load(parser.Get(), &document) == 0) {
      error = parser.Problem();
      return false;
    }
    const std::unique_ptr<yaml_document_t, DocumentRelease> owner(&document);
    if (yaml_document_get_root_node(&document) != nullptr) value = Converter(document).Convert(1);
    return true;
  } catch (const std::exception& exception) {
    error = exception.what();
    return false;
  }
}

}  // namespace qx
