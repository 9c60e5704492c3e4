#include "tests/faults/run_checks.h"

#include <windows.h>
// windows.h has to come first.
#include <json/value.h>
#include <winternl.h>

#include <algorithm>
#include <cctype>

#include "core/files.h"
#include "core/format.h"
#include "core/json.h"
#include "core/text.h"
#include "core/walk_dir.h"
#include "report/archive.h"
#include "stutil/package.h"
#include "systeminfo/handle_table.h"
#include "systeminfo/wmi_wrapper.h"
#include "tests/faults/fault_layer.h"

namespace faults {
namespace {

constexpr uint64_t kLargestFile = uint64_t{1} << 30;
constexpr auto kSystemHandleInformation = static_cast<SYSTEM_INFORMATION_CLASS>(16);

std::string ArchiveProblem(std::string_view bytes) {
  std::string error;
  const auto archive = report::Archive::Open(bytes, error);
  if (!archive) return "no archive: " + error;
  std::string content;
  for (const report::ArchiveEntry& entry : archive->Entries()) {
    if (!archive->Read(entry, content, error)) return entry.name + ": " + error;
  }
  return archive->LeftOut().empty() ? "" : "entries that no reader would take";
}

// An archive, or a package for the key that lies in the current directory.
std::string PackageProblem(const std::string& bytes) {
  if (bytes.starts_with("PK")) return ArchiveProblem(bytes);
  std::string key;
  std::string plain;
  if (ReadWholeFile(L"privateKey.pem", kLargestFile, key) != ERROR_SUCCESS) return "no key";
  const DWORD error = stutil::DecryptBuffer(key, bytes, plain);
  return error == ERROR_SUCCESS ? ArchiveProblem(plain) : "no package, error " + std::to_string(error);
}

std::string JsonProblem(const std::string& bytes) {
  Json::Value document;
  std::string error;
  return ParseJson(bytes, document, error) ? "" : error;
}

bool IsWordCharacter(char letter) {
  return std::isalnum(static_cast<unsigned char>(letter)) != 0;
}

bool HasWord(std::string_view text, std::string_view word) {
  for (size_t at = text.find(word); at != std::string_view::npos; at = text.find(word, at + 1)) {
    const bool begins = at == 0 || !IsWordCharacter(text[at - 1]) || text.substr(0, at).ends_with("0x");
    const size_t end = at + word.size();
    if (begins && (end == text.size() || !IsWordCharacter(text[end]))) return true;
  }
  return false;
}

}  // namespace

size_t CountHandles() {
  DWORD count = 0;
  if (GetProcessHandleCount(GetCurrentProcess(), &count) && count != 0) return count;
  const auto query = reinterpret_cast<decltype(&NtQuerySystemInformation)>(RealCall(row::NtQuerySystemInformation_));
  static std::vector<char> reply(size_t{1} << 20);
  if (query(kSystemHandleInformation, reply.data(), static_cast<ULONG>(reply.size()), nullptr) < 0) return 0;
  return systeminfo::HandleTable({reply.data(), reply.size()}).HandlesOf(GetCurrentProcessId()).size();
}

std::set<std::wstring> FilesBelow(const std::wstring& folder) {
  std::set<std::wstring> files;
  WalkDir(folder, [&](const qx::PathString& path, const WIN32_FIND_DATAW&) {
    files.insert(std::wstring(path).substr(folder.size()));
    return kWalkContinue;
  });
  return files;
}

std::string FileProblem(const std::wstring& path) {
  const std::wstring_view name = path;
  if (name.ends_with(kPartialSuffix) || FolderExists(path)) return {};
  std::string bytes;
  if (const DWORD error = ReadWholeFile(path, kLargestFile, bytes)) return "cannot be read, " + std::to_string(error);
  if (name.ends_with(L".zip")) return PackageProblem(bytes);
  if (name.ends_with(L".json")) return JsonProblem(bytes);
  if (name.ends_with(L".log")) return bytes.ends_with("\n") ? "" : "the last line has no end";
  if (name.ends_with(L".csv")) return bytes.empty() || bytes.ends_with("\n") ? "" : "the last line has no end";
  if (name.ends_with(L".dmp")) return bytes.starts_with("MDMP") ? "" : "no dump";
  std::string whole;
  if (!name.ends_with(L"-upload.bin")) return "unknown kind of file";
  ReadWholeFile(L"upload.bin", kLargestFile, whole);
  return bytes == whole ? "" : "not what was uploaded";
}

std::vector<std::string> LogReader::NewRecords() {
  std::vector<std::string> records;
  for (const std::wstring& name : FilesBelow(m_folder)) {
    auto known = std::find_if(m_read.begin(), m_read.end(), [&](const auto& file) { return file.first == name; });
    if (known == m_read.end()) known = m_read.insert(m_read.end(), {name, 0});
    std::string text;
    ReadWholeFile(m_folder + name, kLargestFile, text);
    std::string_view rest = std::string_view(text).substr(std::min<size_t>(known->second, text.size()));
    known->second = text.size();
    while (!rest.empty()) {
      const size_t end = std::min(rest.find('\n'), rest.size() - 1);
      const std::string_view line = rest.substr(0, end);
      rest.remove_prefix(end + 1);
      constexpr size_t kTimeWidth = 24;
      if (line.size() > kTimeWidth && std::isdigit(static_cast<unsigned char>(line[0])) != 0) {
        const std::string_view level = line.substr(kTimeWidth, line.find(' ', kTimeWidth) - kTimeWidth);
        const size_t function = std::min(line.find('['), line.size());
        records.push_back(std::string(level) + " " + std::string(line.substr(function)));
      } else if (!records.empty()) {
        records.back() += line;
      }
    }
  }
  return records;
}

std::string WithoutDigits(std::string_view record) {
  std::string text;
  for (const char letter : record) {
    if (std::isxdigit(static_cast<unsigned char>(letter)) == 0) {
      text += letter;
    } else if (!text.ends_with('#')) {
      text += '#';
    }
  }
  return text;
}

bool TellsError(std::string_view record, FailsAs failsAs, uint32_t error) {
  const uint32_t code = failsAs == FailsAs::kHresult ? static_cast<uint32_t>(HRESULT_FROM_WIN32(error)) : error;
  for (const wchar_t* format : {L"%u", L"%d", L"%x", L"%X", L"%08x"}) {
    if (HasWord(record, ToUtf8(Format(format, code)))) return true;
  }
  const bool hasName = failsAs == FailsAs::kWmi;
  return hasName && record.find(ToUtf8(WbemErrorName(static_cast<HRESULT>(error)))) != std::string_view::npos;
}

}  // namespace faults
