#include "companions/engine/devtools_message.h"

#include <algorithm>
#include <charconv>

#include "core/json.h"

namespace engine {
namespace {

const Json::Value& Object(const Json::Value& message, const char* member) {
  static const Json::Value s_empty(Json::objectValue);
  const Json::Value& found = MemberOf(message, member);
  return found.isObject() ? found : s_empty;
}

}  // namespace

const Json::Value& MemberOf(const Json::Value& object, const char* member) {
  static const Json::Value s_null;
  return object.isObject() && object.isMember(member) ? object[member] : s_null;
}

std::string TextOf(const Json::Value& object, const char* member) {
  const Json::Value& found = MemberOf(object, member);
  return found.isString() ? found.asString() : std::string();
}

double NumberOf(const Json::Value& object, const char* member) {
  const Json::Value& found = MemberOf(object, member);
  return found.isNumeric() ? found.asDouble() : 0;
}

std::optional<DevToolsMessage> ParseDevToolsMessage(std::string_view text, std::string& error) {
  Json::Value json;
  if (!ParseJson(text, json, error)) return {};
  DevToolsMessage message;
  message.sessionId = TextOf(json, "sessionId");
  message.method = TextOf(json, "method");
  if (!message.method.empty()) {
    message.content = Object(json, "params");
    return message;
  }
  if (!MemberOf(json, "id").isUInt64()) {
    error = "neither an answer nor an event";
    return {};
  }
  message.kind = DevToolsMessage::Kind::kAnswer;
  message.id = json["id"].asUInt64();
  message.content = Object(json, "result");
  if (json.isMember("error")) {
    message.error = TextOf(json["error"], "message");
    if (message.error.empty()) message.error = "refused without a reason";
  }
  return message;
}

std::string WriteDevToolsCommand(uint64_t id, const char* method, const Json::Value& params,
                                 const std::string& sessionId) {
  Json::Value command(Json::objectValue);
  command["id"] = Json::UInt64{id};
  command["method"] = method;
  if (!params.isNull()) command["params"] = params;
  if (!sessionId.empty()) command["sessionId"] = sessionId;
  return WriteCompactJson(command);
}

std::optional<DevToolsAddress> ParseActivePort(std::string_view text) {
  DevToolsAddress address;
  const size_t lineEnd = text.find('\n');
  if (lineEnd == std::string_view::npos) return {};
  const auto [end, error] = std::from_chars(text.data(), text.data() + lineEnd, address.port);
  if (error != std::errc() || end != text.data() + lineEnd || address.port == 0) return {};
  std::string_view path = text.substr(lineEnd + 1);
  path = path.substr(0, path.find_first_of("\r\n"));
  if (!path.starts_with("/devtools/browser/") || path.size() > 200) return {};
  for (const char c : path) {
    if (c <= ' ' || c > '~') return {};
  }
  address.path = path;
  return address;
}

bool MessageSplitter::Add(std::string_view bytes) {
  m_bytes += bytes;
  // The bytes before m_searched hold no end of a message.
  const size_t end = m_bytes.find('\0', m_searched);
  return std::min(end, m_bytes.size()) <= kLargestMessage;
}

std::optional<std::string> MessageSplitter::Next() {
  const size_t end = m_bytes.find('\0', m_searched);
  if (end == std::string::npos) {
    m_searched = m_bytes.size();
    return {};
  }
  std::string message = m_bytes.substr(0, end);
  m_bytes.erase(0, end + 1);
  m_searched = 0;
  return message;
}

}  // namespace engine
