// Raises the product's own logging to full detail while a user reproduces an issue, and lowers it again. Two things are
// turned together: the control block that running components look at, and "Logger.xml" in the program's folder.
//
// What was there before is kept in a marker file beside "Logger.xml" from before the first change until it has been put
// back, so that a later start can do that when this process is killed. Any thread may call; calls wait for each other.
#pragma once

#include <cstdint>
#include <string>

namespace stutil {

// One half each. They know nothing of the marker.
bool ActivateCSTLogs(uint32_t level);
bool SetEndpontLogLevel(const std::wstring& depth, const std::wstring& level);

// Both attempt both halves, the block first, and are true when both succeeded. Disabling puts back exactly what was
// there before activating; without having activated it writes the settings of a product that nobody looks at.
bool ActivateProductLogging();
bool DisableProductLogging();

// Puts back what a run that was killed, or this one, has left raised. True when nothing is raised any more.
bool RestoreProductLogging();

// The same for a "Logger.xml" in another folder.
class ProductLogging {
 public:
  explicit ProductLogging(const std::wstring& folder);

  bool Activate() const;
  bool Disable() const;
  bool Restore() const;
  bool SetLogLevel(const std::wstring& depth, const std::wstring& level) const;

  const std::wstring& MarkerPath() const { return m_marker; }

 private:
  bool KeepFormer(bool& isFileKept) const;
  bool PutBack(const std::string& marker) const;
  bool PutBackLoggerXml(const std::string& former) const;
  bool Write(const std::string& text) const;
  bool LowerToDefaults() const;

  std::wstring m_loggerXml;
  std::wstring m_marker;
};

}  // namespace stutil
