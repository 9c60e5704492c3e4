// What goes over the DevTools connection, as text: commands out, answers and events in. The browser is not trusted to
// speak well. Includes no Windows header.
#pragma once

#include <json/value.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace engine {

inline constexpr size_t kLargestMessage = size_t{64} << 20;  // bytes; a frame of a large window has some 10 MB

struct DevToolsMessage {
  enum class Kind { kAnswer, kEvent } kind = Kind::kEvent;
  uint64_t id = 0;        // of an answer: the command's
  std::string error;      // of an answer: why the command failed; empty when it did not
  std::string method;     // of an event
  std::string sessionId;  // empty: of the browser itself
  Json::Value content;    // result or parameters; always an object
};

// Nothing when `text` is not a message; `error` says why.
std::optional<DevToolsMessage> ParseDevToolsMessage(std::string_view text, std::string& error);

std::string WriteDevToolsCommand(uint64_t id, const char* method, const Json::Value& params,
                                 const std::string& sessionId);

// Members of a message's content. What is missing or of another type is the empty value.
std::string TextOf(const Json::Value& object, const char* member);
double NumberOf(const Json::Value& object, const char* member);
const Json::Value& MemberOf(const Json::Value& object, const char* member);  // null when it is not there

// The content of the file `DevToolsActivePort`, which the browser writes into its profile folder.
struct DevToolsAddress {
  uint16_t port = 0;
  std::string path;
};
std::optional<DevToolsAddress> ParseActivePort(std::string_view text);

// Cuts messages that end with a zero byte out of a stream.
class MessageSplitter {
 public:
  // False: a message is longer than kLargestMessage; the stream is of no use any more.
  bool Add(std::string_view bytes);
  std::optional<std::string> Next();

 private:
  std::string m_bytes;
  size_t m_searched = 0;
};

}  // namespace engine
