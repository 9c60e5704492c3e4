// The stream of a browser: messages that end with a zero byte, and the file that says where it listens.
#include "companions/engine/devtools_message.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  using namespace engine;
  // The same stream, whole and in pieces, holds the same messages.
  std::vector<std::string> whole;
  MessageSplitter splitter;
  PROMISE(splitter.Add(bytes));
  while (auto message = splitter.Next())
    whole.push_back(std::move(*message));
  PROMISE(whole.size() == static_cast<size_t>(std::count(bytes.begin(), bytes.end(), '\0')));
  MessageSplitter pieces;
  size_t index = 0;
  for (size_t at = 0, length = 1; at < bytes.size(); at += length, length = length * 3 % 64 + 1) {
    PROMISE(pieces.Add(bytes.substr(at, length)));
    while (const auto message = pieces.Next())
      PROMISE(index < whole.size() && *message == whole[index++]);
  }
  PROMISE(index == whole.size());

  whole.emplace_back(bytes.substr(0, bytes.find('\0')));
  for (const std::string& text : whole) {
    std::string error;
    const auto message = ParseDevToolsMessage(text, error);
    PROMISE(message || !error.empty());
    if (!message) continue;
    PROMISE(message->content.isObject());
    PROMISE((message->kind == DevToolsMessage::Kind::kEvent) == !message->method.empty());
    TextOf(message->content, "type");
    NumberOf(message->content, "id");
    MemberOf(message->content, "args");
  }
  const auto address = ParseActivePort(bytes);
  PROMISE(!address || (address->port != 0 && address->path.starts_with("/devtools/browser/")));
}
