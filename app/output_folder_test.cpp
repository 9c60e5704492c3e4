#include "app/output_folder.h"

#include <windows.h>

#include <gtest/gtest.h>

#include "core/files.h"

namespace {

const std::vector<ProtectedFolder> kProtected = {
    {L"\\\\?\\C:\\Users\\J\u00f6rg\\AppData\\Local\\Temp\\", L"the temporary folder"},
    {L"\\\\?\\C:\\Windows", L"the Windows folder"},
    {L"\\\\?\\UNC\\server\\share\\tools", L"the program's folder"},
    {L"", L"a folder that the system does not know"},
};

}  // namespace

TEST(OutputFolderRefusal, RefusesRootsAndWhatHoldsAProtectedFolder) {
  const std::wstring zero(L"\\\\?\\C:\\Windows\0x", 16);
  const std::wstring rows[] = {
      L"",
      zero,
      L"\\\\?\\C:\\",
      L"\\\\?\\C:",
      L"\\\\?\\Z:\\",
      L"\\\\?\\UNC\\server\\share",
      L"\\\\?\\UNC\\server\\share\\",
      L"\\\\?\\UNC\\server",
      L"\\\\?\\Volume{0}\\",
      L"\\\\?\\GLOBALROOT\\Device\\HarddiskVolume1\\x",
      L"\\\\.\\C:\\x",
      L"\\\\?\\C:\\Users",
      L"\\\\?\\c:\\users\\J\u00d6RG",
      L"\\\\?\\C:\\Users\\J\u00f6rg\\AppData\\Local\\Temp",
      L"\\\\?\\C:\\WINDOWS\\",
      L"\\\\?\\UNC\\SERVER\\share\\tools",
  };
  for (const std::wstring& row : rows)
    EXPECT_FALSE(OutputFolderRefusal(row, kProtected).empty()) << row;
  EXPECT_EQ(OutputFolderRefusal(L"\\\\?\\C:\\windows", kProtected), L"it is, or holds, the Windows folder");
}

TEST(OutputFolderRefusal, TakesSiblingsAndWhatLiesInside) {
  for (const wchar_t* row :
       {L"\\\\?\\C:\\Windows2", L"\\\\?\\C:\\Win", L"\\\\?\\C:\\Users\\J\u00f6rg\\AppData\\Local\\Temp\\collected",
        L"\\\\?\\C:\\Windows\\Temp\\collected", L"\\\\?\\D:\\Windows", L"\\\\?\\UNC\\server\\share\\collected",
        L"\\\\?\\UNC\\server\\share\\tool", L"\\\\?\\Volume{0}\\collected"}) {
    EXPECT_EQ(OutputFolderRefusal(row, kProtected), L"") << row;
  }
}

TEST(OutputFolderRefusal, KnowsThisMachinesFoldersByEverySpelling) {
  const std::vector<ProtectedFolder> folders = ProtectedFolders();
  wchar_t windows[MAX_PATH] = {};
  GetWindowsDirectoryW(windows, MAX_PATH);
  const std::wstring spellings[] = {L".",
                                    L".\\",
                                    L"..",
                                    L"collected\\..",
                                    windows,
                                    std::wstring(windows) + L"\\.\\",
                                    std::wstring(windows) + L"\\system32",
                                    std::wstring(L"\\\\?\\") + windows,
                                    L"C:\\PROGRA~1",
                                    L"C:/"};
  for (const std::wstring& folder : spellings) {
    if (folder.find(L'~') != std::wstring::npos && !FolderExists(folder)) continue;  // short names may be off
    EXPECT_NE(OutputFolderRefusal(NormalFolder(folder), folders), L"") << folder;
  }
  EXPECT_EQ(OutputFolderRefusal(NormalFolder(L"collected"), folders), L"");
}
