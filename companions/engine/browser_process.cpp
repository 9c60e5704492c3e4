#include "companions/engine/browser_process.h"

#include <bcrypt.h>
#include <lmcons.h>

#include <utility>
#include <vector>

#include "companions/engine/browser_command.h"
#include "core/delete_folder.h"
#include "core/files.h"
#include "core/format.h"
#include "core/private_access.h"
#include "core/text.h"

namespace engine {
namespace {

constexpr ULONGLONG kConnectTimeout = 15000;  // milliseconds
constexpr DWORD kPollInterval = 10;
constexpr DWORD kEndTimeout = 3000;
constexpr DWORD kTouchInterval = 4000;  // how often the watching shell is told that this process lives
constexpr wchar_t kProfilePrefix[] = L"st-engine-";
constexpr wchar_t kMarkSuffix[] = L".life";
constexpr DWORD kPipeSize = 1u << 20;

struct AttributeListTraits {
  using Type = LPPROC_THREAD_ATTRIBUTE_LIST;
  static bool IsValid(Type list) { return list != nullptr; }
  static void Close(Type list) { DeleteProcThreadAttributeList(list); }
};
using AttributeList = Scoped<AttributeListTraits>;

// Nobody can know it before. Empty on failure.
std::wstring RandomName() {
  unsigned char bytes[16] = {};
  if (BCryptGenRandom(nullptr, bytes, sizeof bytes, BCRYPT_USE_SYSTEM_PREFERRED_RNG) != 0) return {};
  std::wstring name = kProfilePrefix;
  for (const unsigned char byte : bytes)
    name += Format(L"%02x", byte);
  return name;
}

// A Unix browser refuses to run as root with its sandbox. On Windows it always has one.
bool IsUnixRoot() {
  wchar_t name[UNLEN + 1] = {};
  DWORD size = UNLEN + 1;
  return GetUserNameW(name, &size) && std::wstring_view(name) == L"root";
}

void Touch(HANDLE file) {
  FILETIME now{};
  GetSystemTimeAsFileTime(&now);
  SetFileTime(file, nullptr, nullptr, &now);
}

// A mark whose owner lives cannot be deleted; one that a power failure left can.
bool HasOwner(const std::wstring& mark) {
  return PathExists(mark) && !DeleteFileW(ExtendedPath(mark).c_str());
}

// Deletes the profiles of processes that were killed. Those of Unix browsers are the watching shell's affair.
void DeleteOrphans(const std::wstring& parent) {
  WIN32_FIND_DATAW data{};
  const FindHandle find(FindFirstFileW(ExtendedPath(parent + kProfilePrefix + L"*").c_str(), &data));
  if (!find) return;
  do {
    const std::wstring path = parent + data.cFileName;
    const bool isFolder = (data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
    if (isFolder && !HasOwner(path + kMarkSuffix)) DeleteFolder(path, true);
  } while (FindNextFileW(find.Get(), &data));
}

KernelHandle MakeMark(const std::wstring& path) {
  return KernelHandle(CreateFileW(ExtendedPath(path).c_str(), FILE_WRITE_ATTRIBUTES | DELETE, 0, nullptr, CREATE_NEW,
                                  FILE_FLAG_DELETE_ON_CLOSE, nullptr));
}

}  // namespace

// The ends that the browser inherits.
struct BrowserProcess::Pipes {
  KernelHandle readEnd;
  KernelHandle writeEnd;
};

bool BrowserProcess::MakeProfile(const std::wstring& program, std::wstring& error) {
  wchar_t temporary[MAX_PATH + 1] = {};
  GetTempPathW(MAX_PATH + 1, temporary);
  // A Unix program needs a folder whose Unix path is known.
  const std::wstring parent = m_isUnix ? program.substr(0, 2) + L"\\tmp\\" : std::wstring(temporary);
  const std::wstring name = RandomName();
  if (name.empty()) {
    error = L"no random name for the browser's profile";
    return false;
  }
  m_profile = parent + name;
  m_mark = m_profile + kMarkSuffix;
  m_markHandle = MakeMark(m_mark);  // before the folder, so that nobody takes it for an orphan
  if (!m_markHandle) {
    error = Format(L"the browser's profile cannot be marked with '%s', error %u", m_mark.c_str(), GetLastError());
    m_profile.clear();
    return false;
  }
  if (!m_isUnix) DeleteOrphans(parent);
  if (const DWORD result = CreatePrivateFolder(m_profile); result != ERROR_SUCCESS) {
    error = Format(L"the browser's profile folder '%s' cannot be made, error %u", m_profile.c_str(), result);
    m_profile.clear();
    return false;
  }
  return true;
}

bool BrowserProcess::Start(const std::wstring& program, bool usePort, std::wstring& error) {
  m_isUnix = IsUnixProgram(program);
  m_usesPort = usePort || m_isUnix;
  m_runsWithoutSandbox = m_isUnix && IsUnixRoot();
  if (!MakeProfile(program, error)) return false;
  if (m_isUnix) BeginUnixLife();
  Pipes pipes;
  BrowserStart start{program, m_profile, m_mark, 0, 0, !m_runsWithoutSandbox};
  if (!m_usesPort) {
    SECURITY_ATTRIBUTES inherited{sizeof inherited, nullptr, TRUE};
    if (!CreatePipe(m_fromBrowser.Receive(), pipes.writeEnd.Receive(), &inherited, kPipeSize) ||
        !CreatePipe(pipes.readEnd.Receive(), m_toBrowser.Receive(), &inherited, kPipeSize)) {
      error = Format(L"no pipe to the browser, error %u", GetLastError());
      return false;
    }
    SetHandleInformation(m_fromBrowser.Get(), HANDLE_FLAG_INHERIT, 0);
    SetHandleInformation(m_toBrowser.Get(), HANDLE_FLAG_INHERIT, 0);
    start.readHandle = reinterpret_cast<uintptr_t>(pipes.readEnd.Get());
    start.writeHandle = reinterpret_cast<uintptr_t>(pipes.writeEnd.Get());
  }
  return CreateInJob(BrowserCommandLine(start), pipes, error);
}

// Without the job a killed program would leave its browser behind.
bool BrowserProcess::MakeJob() {
  JOBOBJECT_EXTENDED_LIMIT_INFORMATION limits{};
  limits.BasicLimitInformation.LimitFlags = JOB_OBJECT_LIMIT_KILL_ON_JOB_CLOSE;
  m_job.Reset(CreateJobObjectW(nullptr, nullptr));
  return m_job && SetInformationJobObject(m_job.Get(), JobObjectExtendedLimitInformation, &limits, sizeof limits);
}

bool BrowserProcess::CreateInJob(std::wstring commandLine, const Pipes& pipes, std::wstring& error) {
  if (!MakeJob()) {
    error = Format(L"no job for the browser, error %u", GetLastError());
    return false;
  }
  // Only the pipes are inherited, whatever else of this process could be; and there is no moment outside of the job.
  HANDLE inherited[] = {pipes.readEnd.Get(), pipes.writeEnd.Get()};
  HANDLE jobs[] = {m_job.Get()};
  const bool inherits = static_cast<bool>(pipes.readEnd);
  SIZE_T size = 0;
  InitializeProcThreadAttributeList(nullptr, 2, 0, &size);
  std::vector<std::byte> memory(size);
  STARTUPINFOEXW startup{};
  startup.StartupInfo.cb = sizeof startup;
  startup.lpAttributeList = reinterpret_cast<LPPROC_THREAD_ATTRIBUTE_LIST>(memory.data());
  if (!InitializeProcThreadAttributeList(startup.lpAttributeList, 2, 0, &size)) {
    error = Format(L"no attribute list for the browser, error %u", GetLastError());
    return false;
  }
  const AttributeList attributes(startup.lpAttributeList);
  const auto add = [&](DWORD_PTR attribute, HANDLE* handles, SIZE_T bytes) {
    return UpdateProcThreadAttribute(attributes.Get(), 0, attribute, handles, bytes, nullptr, nullptr) != FALSE;
  };
  if ((inherits && !add(PROC_THREAD_ATTRIBUTE_HANDLE_LIST, inherited, sizeof inherited)) ||
      (!m_isUnix && !add(PROC_THREAD_ATTRIBUTE_JOB_LIST, jobs, sizeof jobs))) {
    error = Format(L"the browser cannot be given its pipes and its job, error %u", GetLastError());
    return false;
  }
  PROCESS_INFORMATION process{};
  if (!CreateProcessW(nullptr, commandLine.data(), nullptr, nullptr, inherits,
                      CREATE_NO_WINDOW | EXTENDED_STARTUPINFO_PRESENT, nullptr, nullptr, &startup.StartupInfo,
                      &process)) {
    error = Format(L"the browser cannot be started, error %u", GetLastError());
    return false;
  }
  m_isStarted = true;
  // Of a Unix program there are no handles. What stands in their place may be the number of any handle of this process.
  if (m_isUnix) return true;
  const KernelHandle thread(process.hThread);
  m_process.Reset(process.hProcess);
  return true;
}

void BrowserProcess::BeginUnixLife() {
  m_lifeEnds.Reset(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  m_lifeThread = std::thread([ends = m_lifeEnds.Get(), mark = m_markHandle.Get()] {
    while (WaitForSingleObject(ends, kTouchInterval) == WAIT_TIMEOUT)
      Touch(mark);
  });
}

bool BrowserProcess::HasEnded() const {
  if (m_isUnix) return PathExists(m_profile + L"\\ended");
  return m_process && WaitForSingleObject(m_process.Get(), 0) == WAIT_OBJECT_0;
}

std::wstring BrowserProcess::LastWords() const {
  std::string log;
  if (ReadWholeFile(m_profile + L"\\browser.log", 1 << 20, log) != ERROR_SUCCESS || log.empty()) return {};
  return L": " + ToWide(log.substr(0, 500));
}

std::unique_ptr<Transport> BrowserProcess::Connect(std::wstring& error) {
  if (!m_usesPort) return MakePipeTransport(std::move(m_fromBrowser), std::move(m_toBrowser));
  const std::wstring portFile = m_profile + L"\\DevToolsActivePort";
  for (const ULONGLONG start = GetTickCount64(); GetTickCount64() - start < kConnectTimeout; Sleep(kPollInterval)) {
    std::string text;
    if (ReadWholeFile(portFile, 1000, text) == ERROR_SUCCESS) {
      if (const auto address = ParseActivePort(text)) return ConnectWebSocket(*address, error);
    }
    if (HasEnded()) {
      error = L"the browser ended at once" + LastWords();
      return nullptr;
    }
  }
  error = L"the browser opens no port" + LastWords();
  return nullptr;
}

void BrowserProcess::End() noexcept {
  if (m_lifeThread.joinable()) {
    SetEvent(m_lifeEnds.Get());
    m_lifeThread.join();
  }
  m_fromBrowser.Reset();
  m_toBrowser.Reset();
  if (m_job) TerminateJobObject(m_job.Get(), 1);
  m_job.Reset();
  if (m_process) WaitForSingleObject(m_process.Get(), kEndTimeout);
  m_process.Reset();
  if (std::exchange(m_isStarted, false) && m_isUnix) {
    m_markHandle.Reset();  // the shell ends the browser and deletes the profile when the mark has gone
    m_profile.clear();
  }
  if (m_profile.empty()) return;
  // Its other processes may hold files of the profile for a moment longer.
  for (const ULONGLONG start = GetTickCount64(); !DeleteFolder(m_profile, true); Sleep(kPollInterval)) {
    if (GetTickCount64() - start > kEndTimeout) break;
  }
  m_markHandle.Reset();
  m_profile.clear();
}

}  // namespace engine
