#include "companions/engine/browser_finder.h"

#include <windows.h>

#include "core/files.h"

namespace engine {
namespace {

constexpr const wchar_t* kRegistered[] = {L"msedge.exe", L"chrome.exe", L"chromium.exe"};

constexpr const wchar_t* kUsualPaths[] = {
    L"%ProgramFiles(x86)%\\Microsoft\\Edge\\Application\\msedge.exe",
    L"%ProgramFiles%\\Microsoft\\Edge\\Application\\msedge.exe",
    L"%ProgramFiles%\\Google\\Chrome\\Application\\chrome.exe",
    L"%ProgramFiles(x86)%\\Google\\Chrome\\Application\\chrome.exe",
    L"%ProgramFiles%\\Chromium\\Application\\chrome.exe",
    L"Z:\\usr\\bin\\chromium",
    L"Z:\\usr\\bin\\chromium-browser",
    L"Z:\\usr\\bin\\google-chrome",
};

bool IsFile(const std::wstring& path) {
  return PathExists(path) && !FolderExists(path);
}

std::wstring RegisteredPath(const std::wstring& name) {
  const std::wstring key = L"SOFTWARE\\Microsoft\\Windows\\CurrentVersion\\App Paths\\" + name;
  wchar_t path[1024] = {};
  DWORD size = sizeof path;
  if (RegGetValueW(HKEY_LOCAL_MACHINE, key.c_str(), nullptr, RRF_RT_REG_SZ, nullptr, path, &size) != ERROR_SUCCESS) {
    return {};
  }
  std::wstring text = path;
  if (text.size() > 2 && text.front() == L'"' && text.back() == L'"') text = text.substr(1, text.size() - 2);
  return text;
}

}  // namespace

std::wstring FindBrowser() {
  for (const wchar_t* name : kRegistered) {
    std::wstring path = RegisteredPath(name);
    if (!path.empty() && IsFile(path)) return path;
  }
  for (const wchar_t* usual : kUsualPaths) {
    std::wstring path = ExpandEnvironment(usual);
    if (path.find(L'%') == std::wstring::npos && IsFile(path)) return path;
  }
  return {};
}

}  // namespace engine
