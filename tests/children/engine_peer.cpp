// Stands in for a browser: takes the pipes that a browser would, and behaves as the end of its own file name says
// (engine_peer_silent.exe, ...). "good" answers as much as the engine needs to take a page for loaded.
#include <windows.h>

#include <cstdlib>
#include <string>

namespace {

struct Pipes {
  HANDLE in = nullptr;
  HANDLE out = nullptr;
};

Pipes ReadPipes(const std::wstring& commandLine) {
  static constexpr wchar_t kSwitch[] = L"--remote-debugging-io-pipes=";
  const size_t at = commandLine.find(kSwitch);
  if (at == std::wstring::npos) std::exit(2);
  wchar_t* end = nullptr;
  const auto in = wcstoull(commandLine.c_str() + at + wcslen(kSwitch), &end, 10);
  const auto out = wcstoull(end + 1, nullptr, 10);
  return {reinterpret_cast<HANDLE>(in), reinterpret_cast<HANDLE>(out)};
}

void Send(const Pipes& pipes, const std::string& message) {
  const std::string framed = message + '\0';
  DWORD count = 0;
  if (!WriteFile(pipes.out, framed.data(), static_cast<DWORD>(framed.size()), &count, nullptr)) std::exit(0);
}

std::string Receive(const Pipes& pipes) {
  std::string message;
  for (;;) {
    char c = 0;
    DWORD count = 0;
    if (!ReadFile(pipes.in, &c, 1, &count, nullptr) || count == 0) std::exit(0);
    if (c == '\0') return message;
    message += c;
  }
}

bool Has(const std::string& message, const char* part) {
  return message.find(part) != std::string::npos;
}

std::string IdOf(const std::string& message) {
  return std::to_string(std::strtoull(message.c_str() + message.find("\"id\":") + 5, nullptr, 10));
}

std::string ResultOf(const std::string& command) {
  if (Has(command, "Target.getTargets")) return R"({"targetInfos":[{"type":"other"},{"type":"page","targetId":"T"}]})";
  if (Has(command, "Target.attachToTarget")) return R"({"sessionId":"S"})";
  if (Has(command, "Page.navigate")) return R"({"frameId":"F"})";
  if (Has(command, "nothingAsked")) return R"({"result":{"type":"undefined"}})";
  if (Has(command, "Runtime.evaluate")) return R"({"result":{"value":{"returned":{"m":["answer",42]}}}})";
  return "{}";
}

// A page function that calls native code, and returns when it has the answer.
void CallNative(const Pipes& pipes, const std::string& name) {
  Send(pipes, R"({"method":"Fetch.requestPaused","params":{"requestId":"call","request":{"url":)"
              R"("https://res.engine.invalid/.native-call","postData":"{\"call\":\")" +
                  name + R"(\",\"args\":[]}"}}})");
  while (!Has(Receive(pipes), "Fetch.fulfillRequest")) {
  }
}

void Answer(const Pipes& pipes, const std::string& command) {
  if (Has(command, "pleaseDie")) std::exit(0);
  if (Has(command, "pleaseHang")) return;
  if (Has(command, "calls_throw")) CallNative(pipes, "throw");
  if (Has(command, "\\\"id\\\":7")) CallNative(pipes, "any");
  Send(pipes, "{\"id\":" + IdOf(command) + ",\"result\":" + ResultOf(command) + "}");
  if (Has(command, "Page.navigate")) {
    Send(pipes, "this is no message");
    Send(pipes, R"({"id":999999,"result":{}})");
    Send(pipes, R"({"method":"Fetch.requestPaused","params":{"requestId":7,"request":"nonsense"}})");
    Send(pipes, R"({"method":"Page.screencastFrame","params":{"data":"!!!","sessionId":1}})");
    if (Has(command, "leaving.htm")) {
      Send(pipes, R"({"method":"Page.frameNavigated","params":{"frame":{"id":"I","parentId":"F","url":"data:,"}}})");
      Send(pipes, R"({"method":"Page.loadEventFired","params":{}})");
      Send(pipes, R"({"method":"Page.frameNavigated","params":{"frame":{"id":"F","url":"about:blank"}}})");
    }
    if (!Has(command, "never.htm")) Send(pipes, R"({"method":"Page.loadEventFired","params":{}})");
  }
}

void Behave(const std::string& manner, const Pipes& pipes) {
  if (manner == "ending") return;
  if (manner == "garbage") {
    for (;;)
      Send(pipes, "\xFF\xFE garbage {");
  }
  if (manner == "endless") {
    const std::string block(1 << 20, 'x');
    DWORD count = 0;
    while (WriteFile(pipes.out, block.data(), static_cast<DWORD>(block.size()), &count, nullptr)) {
    }
  }
  for (;;) {
    const std::string command = Receive(pipes);
    if (manner == "refusing") Send(pipes, "{\"id\":" + IdOf(command) + ",\"error\":{\"message\":\"I will not\"}}");
    if (manner == "good") Answer(pipes, command);
  }
}

}  // namespace

int main() {
  char path[MAX_PATH] = {};
  GetModuleFileNameA(nullptr, path, MAX_PATH);
  std::string name = path;
  name = name.substr(name.rfind('_') + 1);
  Behave(name.substr(0, name.find('.')), ReadPipes(GetCommandLineW()));
}
