#include "companions/upload/upload_config.h"

#include <algorithm>

#include "core/json.h"

namespace qxlink {
namespace {

constexpr std::string_view kHttps = "https://";
constexpr std::string_view kHttp = "http://";

bool StartsWithIgnoringCase(std::string_view text, std::string_view lowerCasePrefix) {
  return text.size() >= lowerCasePrefix.size() &&
         std::equal(lowerCasePrefix.begin(), lowerCasePrefix.end(), text.begin(), [](char expected, char actual) {
           return expected == (actual >= 'A' && actual <= 'Z' ? actual - 'A' + 'a' : actual);
         });
}

// White space and control characters, which have no place in an address or a path.
bool HasControlCharacter(std::string_view text, char last) {
  return std::any_of(text.begin(), text.end(), [last](unsigned char c) { return c <= last || c == 0x7F; });
}

// Empty when the address is fine.
std::string EndpointProblem(std::string_view endpoint, bool allowPlainHttp) {
  std::string_view rest = endpoint;
  if (StartsWithIgnoringCase(endpoint, kHttps)) {
    rest.remove_prefix(kHttps.size());
  } else if (StartsWithIgnoringCase(endpoint, kHttp)) {
    if (!allowPlainHttp) return "\"endpoint\" is an http:// address, which \"allow_plain_http\" does not allow";
    rest.remove_prefix(kHttp.size());
  } else {
    return "\"endpoint\" is not an https:// address";
  }
  if (rest.empty() || rest.front() == '/' || HasControlCharacter(rest, ' ')) return "\"endpoint\" names no host";
  return {};
}

class MemberReader {
 public:
  explicit MemberReader(ParsedUploadConfig& parsed) : m_parsed(parsed) {}

  void Read(const std::string& name, const Json::Value& value) {
    UploadConfig& config = m_parsed.config;
    if (name == "endpoint") {
      ReadText(name, value, config.endpoint);
    } else if (name == "outbox") {
      ReadText(name, value, config.outbox);
    } else if (name != "allow_plain_http") {
      m_parsed.unknownMembers.push_back(name);
    } else if (value.isBool()) {
      config.allowPlainHttp = value.asBool();
    } else {
      m_parsed.problems.push_back("\"allow_plain_http\" is neither true nor false");
    }
  }

 private:
  void ReadText(const std::string& name, const Json::Value& value, std::string& text) {
    if (value.isString()) {
      text = value.asString();
    } else {
      m_parsed.problems.push_back("\"" + name + "\" is not a text");
    }
  }

  ParsedUploadConfig& m_parsed;
};

}  // namespace

ParsedUploadConfig ParseUploadConfig(std::string_view json) {
  ParsedUploadConfig parsed;
  Json::Value document;
  std::string error;
  if (!ParseJson(json, document, error)) {
    parsed.problems.push_back("it is not a JSON document");
    return parsed;
  }
  if (!document.isObject()) {
    parsed.problems.push_back("it is not a JSON object");
    return parsed;
  }
  MemberReader reader(parsed);
  for (const std::string& name : document.getMemberNames())
    reader.Read(name, document[name]);

  const UploadConfig& config = parsed.config;
  if (!config.endpoint.empty()) {
    std::string problem = EndpointProblem(config.endpoint, config.allowPlainHttp);
    if (!problem.empty()) parsed.problems.push_back(std::move(problem));
  }
  if (config.outbox.empty() || HasControlCharacter(config.outbox, '\x1F')) {
    parsed.problems.push_back("\"outbox\" names no folder");
  }
  return parsed;
}

}  // namespace qxlink
