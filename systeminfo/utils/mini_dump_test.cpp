#include "systeminfo/utils/mini_dump.h"

#include <gmock/gmock.h>

#include <cstring>
#include <string>

namespace utils {
namespace {

constexpr MiniDumpLog kLog = {L"test", logging::Level::kInfo};

TEST(DumpFileName, IsTheNameAndTheIdWithoutWhatNoFileNameHolds) {
  EXPECT_EQ(DumpFileName(L"svc.exe", 4294967295U), L"svc.exe_4294967295.dmp");
  EXPECT_EQ(DumpFileName(L"", 1), L"_1.dmp");
  EXPECT_THAT(DumpFileName(L"..\\svc", 7),
              testing::AllOf(testing::StartsWith(L".._svc-"), testing::EndsWith(L"_7.dmp")));
}

TEST(MiniDumpFilter, AModuleLosesItsDataSectionsElseItsCodeSections) {
  struct {
    ULONG before, after;
    const wchar_t* line;
  } const rows[] = {
      {ModuleWriteModule | ModuleWriteDataSeg, ModuleWriteModule, L"test: Excluding module data sections: [C:\\a.dll]"},
      {ModuleWriteModule | ModuleWriteCodeSegs, ModuleWriteModule,
       L"test: Excluding module code sections: [C:\\a.dll]"},
      {ModuleWriteDataSeg | ModuleWriteCodeSegs, ModuleWriteCodeSegs,
       L"test: Excluding module data sections: [C:\\a.dll]"},
      {ModuleWriteModule | ModuleWriteCvRecord, ModuleWriteModule | ModuleWriteCvRecord, nullptr},
  };
  wchar_t path[] = L"C:\\a.dll";
  for (const auto& row : rows) {
    logging::ErrorCapture lines(logging::Level::kInfo);
    MINIDUMP_CALLBACK_INPUT input{};
    input.CallbackType = ModuleCallback;
    input.Module.FullPath = path;
    MINIDUMP_CALLBACK_OUTPUT output{};
    output.ModuleWriteFlags = row.before;
    EXPECT_TRUE(FilterMiniDump(kLog, &input, &output));
    EXPECT_EQ(output.ModuleWriteFlags, row.after) << row.before;
    const std::vector<std::wstring> logged = lines.Take();
    EXPECT_EQ(logged, row.line == nullptr ? std::vector<std::wstring>() : std::vector<std::wstring>{row.line});
  }
}

TEST(MiniDumpFilter, MappedAndImageMemoryThatCannotBeWrittenIsLeftOut) {
  struct {
    ULONG type, protection;
    ULONG64 size;  // afterwards, of 0x3000
  } const rows[] = {
      {MEM_MAPPED, PAGE_READONLY, 0},        {MEM_MAPPED, PAGE_READWRITE, 0x3000}, {MEM_MAPPED, PAGE_WRITECOPY, 0},
      {MEM_IMAGE, PAGE_EXECUTE_READ, 0},     {MEM_IMAGE, PAGE_READWRITE, 0x3000},  {MEM_PRIVATE, PAGE_READONLY, 0x3000},
      {MEM_PRIVATE, PAGE_READWRITE, 0x3000}, {0, PAGE_NOACCESS, 0x3000},
  };
  for (const auto& row : rows) {
    MINIDUMP_CALLBACK_INPUT input{};
    input.CallbackType = IncludeVmRegionCallback;
    VmRegionAnswer answer{};
    answer.region.RegionSize = 0x3000;
    answer.region.Type = row.type;
    answer.region.Protect = row.protection;
    MINIDUMP_CALLBACK_OUTPUT output{};
    std::memcpy(&output, &answer, sizeof answer);
    EXPECT_TRUE(FilterMiniDump(kLog, &input, &output));
    std::memcpy(&answer, &output, sizeof answer);
    EXPECT_EQ(answer.region.RegionSize, row.size) << row.type << " " << row.protection;
    EXPECT_TRUE(answer.proceed);
  }
}

TEST(MiniDumpFilter, EveryOtherQuestionIsAnsweredWithoutAChange) {
  MINIDUMP_CALLBACK_INPUT input{};
  MINIDUMP_CALLBACK_OUTPUT output{};
  EXPECT_FALSE(FilterMiniDump(kLog, nullptr, &output));
  EXPECT_FALSE(FilterMiniDump(kLog, &input, nullptr));
  for (ULONG type = 1; type < 20; ++type) {
    if (type == IncludeVmRegionCallback) continue;
    input.CallbackType = type;
    EXPECT_EQ(FilterMiniDump(kLog, &input, &output), type != CancelCallback) << type;
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(&output), sizeof output), std::string(sizeof output, '\0'))
        << type;
  }
}

}  // namespace
}  // namespace utils
