#include "core/text_table.h"

#include <windows.h>

#include "core/files.h"
#include "core/json.h"
#include "core/text.h"

bool ParseTextTable(std::string_view json, TextTable& table, std::string& error) {
  table.clear();
  Json::Value document;
  if (!ParseJson(json, document, error)) return false;
  if (!document.isObject()) {
    error = "the document is no object";
    return false;
  }
  for (auto member = document.begin(); member != document.end(); ++member) {
    if (!member->isString()) {
      error = "the member " + member.name() + " is no text";
      table.clear();
      return false;
    }
    table.emplace(ToWide(member.name()), ToWide(member->asString()));
  }
  return true;
}

uint32_t ReadTextTable(std::wstring_view path, TextTable& table, std::string& error) {
  constexpr uint64_t kLargest = 4 << 20;
  std::string bytes;
  if (const DWORD failure = ReadWholeFile(path, kLargest, bytes); failure != ERROR_SUCCESS) return failure;
  return ParseTextTable(bytes, table, error) ? ERROR_SUCCESS : ERROR_BAD_FORMAT;
}

uint32_t CopyText(std::wstring_view text, wchar_t* buffer, uint32_t* chars) {
  if (chars == nullptr || text.size() >= UINT32_MAX) return ERROR_INVALID_PARAMETER;
  const uint32_t room = *chars;
  *chars = static_cast<uint32_t>(text.size()) + 1;
  if (buffer == nullptr || room < *chars) return ERROR_INSUFFICIENT_BUFFER;
  text.copy(buffer, text.size());
  buffer[text.size()] = L'\0';
  return ERROR_SUCCESS;
}

uint32_t FetchText(const TextGetter& get, std::wstring& text) {
  constexpr uint32_t kUsualRoom = 512;
  constexpr uint32_t kMostRoom = 1 << 20;
  uint32_t chars = kUsualRoom;
  text.resize(chars);
  uint32_t error = get(text.data(), &chars);
  if (error == ERROR_INSUFFICIENT_BUFFER && chars > kUsualRoom && chars <= kMostRoom) {
    text.resize(chars);
    error = get(text.data(), &chars);
  }
  if (error == ERROR_SUCCESS && (chars == 0 || chars > text.size())) error = ERROR_INVALID_DATA;
  text.resize(error == ERROR_SUCCESS ? chars - 1 : 0);
  return error;
}
