#include "companions/engine/browser_command.h"

#include <algorithm>

#include "companions/engine/embedded_text.h"
#include "core/text.h"

namespace engine {
namespace {

// One page, no window, nothing of its own accord: no first-run pages, updates, reports, extensions or look-ups of
// names. Nothing of the page's is reached by the network anyway; requests are answered by the engine.
constexpr const wchar_t* kArguments[] = {
    L"--headless",
    L"--no-first-run",
    L"--no-default-browser-check",
    L"--disable-extensions",
    L"--disable-component-extensions-with-background-pages",
    L"--disable-component-update",
    L"--disable-background-networking",
    L"--disable-sync",
    L"--disable-breakpad",
    L"--disable-domain-reliability",
    L"--disable-client-side-phishing-detection",
    L"--disable-default-apps",
    L"--disable-prompt-on-repost",
    L"--disable-features=Translate,OptimizationHints,MediaRouter,DialMediaRouteProvider",
    L"--metrics-recording-only",
    L"--password-store=basic",
    L"--use-mock-keychain",
    L"--no-service-autorun",
    L"--do-not-de-elevate",  // it would start itself anew, without the pipes and outside of the job
    L"--block-new-web-contents",
    L"--disable-gpu",
    L"--hide-scrollbars",
    L"--mute-audio",
    L"--no-proxy-server",
    L"--host-resolver-rules=MAP * ~NOTFOUND",
};

}  // namespace

bool IsUnixProgram(std::wstring_view path) {
  return path.size() > 2 && path[1] == L':' && path.substr(2).starts_with(L"\\") && !path.ends_with(L".exe") &&
         !path.ends_with(L".EXE");
}

std::wstring UnixPath(std::wstring_view path) {
  std::wstring unixPath(path.size() > 1 && path[1] == L':' ? path.substr(2) : path);
  std::replace(unixPath.begin(), unixPath.end(), L'\\', L'/');
  return unixPath;
}

std::wstring QuoteArgument(std::wstring_view argument) {
  if (!argument.empty() && argument.find_first_of(L" \t\n\"") == std::wstring_view::npos) return std::wstring(argument);
  std::wstring quoted = L"\"";
  size_t backslashes = 0;
  for (const wchar_t c : argument) {
    // Backslashes count only before a double quote.
    if (c == L'"') quoted.append(backslashes + 1, L'\\');
    backslashes = c == L'\\' ? backslashes + 1 : 0;
    quoted += c;
  }
  quoted.append(backslashes, L'\\');
  return quoted + L"\"";
}

std::wstring BrowserCommandLine(const BrowserStart& start) {
  const bool isUnix = IsUnixProgram(start.program);
  const auto path = [&](const std::wstring& text) { return isUnix ? UnixPath(text) : text; };
  std::vector<std::wstring> arguments;
  if (isUnix) {
    arguments = {start.program.substr(0, 2) + L"\\bin\\sh",
                 L"-c",
                 ToWide(kUnixWatchScript),
                 L"st-engine-watch",
                 path(start.mark),
                 path(start.profile)};
  }
  arguments.push_back(path(start.program));
  arguments.insert(arguments.end(), std::begin(kArguments), std::end(kArguments));
  arguments.push_back(L"--user-data-dir=" + path(start.profile));
  if (start.readHandle != 0) {
    arguments.push_back(L"--remote-debugging-pipe");
    arguments.push_back(L"--remote-debugging-io-pipes=" + std::to_wstring(start.readHandle) + L"," +
                        std::to_wstring(start.writeHandle));
  } else {
    arguments.push_back(L"--remote-debugging-address=127.0.0.1");
    arguments.push_back(L"--remote-debugging-port=0");
  }
  if (!start.hasSandbox) arguments.push_back(L"--no-sandbox");
  arguments.push_back(L"about:blank");
  std::wstring line;
  for (const std::wstring& argument : arguments)
    line += (line.empty() ? L"" : L" ") + QuoteArgument(argument);
  return line;
}

}  // namespace engine
