#include "report/opened_input.h"

#include "core/files.h"
#include "core/text.h"
#include "report/loading.h"

namespace report {

ExitCode OpenedInput::Open(const std::wstring& path, const std::wstring& keyFile, std::string& message) {
  if (FolderExists(path)) {
    m_collection = LoadCollection(path);
    return ExitCode::kNothingFound;
  }
  const ExitCode code = ReadArchiveBytes(path, keyFile, m_input, message);
  if (code != ExitCode::kNothingFound) return code;
  m_archive = Archive::Open(m_input.archive, message);
  if (!m_archive) {
    message = ToUtf8(path) + " " + message + ". Ask for it again.";
    return ExitCode::kBadInput;
  }
  m_collection = LoadCollection(*m_archive);
  return ExitCode::kNothingFound;
}

}  // namespace report
