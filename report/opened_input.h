// A package, archive or folder that was opened: what is in it, or why it cannot be used.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "report/archive.h"
#include "report/collection.h"
#include "report/package_input.h"

namespace report {

// Stays where it was made: the archive points into its bytes.
class OpenedInput {
 public:
  OpenedInput() = default;
  OpenedInput(const OpenedInput&) = delete;
  OpenedInput& operator=(const OpenedInput&) = delete;

  // kNothingFound when it was opened, which does not say that a collection is in it; else `message` says what to do.
  ExitCode Open(const std::wstring& path, const std::wstring& keyFile, std::string& message);

  const Archive* GetArchive() const { return m_archive.get(); }  // null for a folder
  const std::optional<Collection>& GetCollection() const { return m_collection; }
  uint64_t Size() const { return m_input.fileSize; }  // of the file, in bytes; 0 for a folder

 private:
  ArchiveInput m_input;
  std::unique_ptr<Archive> m_archive;
  std::optional<Collection> m_collection;
};

}  // namespace report
