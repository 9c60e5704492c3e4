// The Windows calls that the program depends on, as one table, and the layer that counts them and fails one of them.
// Only test programs are built with it: fault_calls.cpp defines the import pointers of the table's functions, so that
// the program's own sources, unchanged, call through here. Nothing is patched, and nothing of it is in what ships.
//
// To add a call: one row. See docs/security.md, "Faults".
#pragma once

#include <windows.h>

#include <cstddef>
#include <cstdint>
#include <iterator>
#include <span>

namespace faults {

// What a call gives back when it fails; the first three set the thread's last error.
enum class FailsAs {
  kFalse,          // FALSE, a null pointer, a length of 0
  kInvalidHandle,  // INVALID_HANDLE_VALUE, INVALID_FILE_ATTRIBUTES: all bits set
  kNothing,        // a null pointer, and no error is set
  kCode,           // the error itself
  kHresult,        // the error as an HRESULT
  kNtStatus,       // the error is an NTSTATUS
  kWmi,            // the error is a status of WMI
};

// The errors that are tried for a call, all of them documented for its kind. The first one is the one of a short walk.
inline constexpr uint32_t kAny[] = {ERROR_NO_SYSTEM_RESOURCES, ERROR_NOT_ENOUGH_MEMORY};
inline constexpr uint32_t kPath[] = {ERROR_NO_SYSTEM_RESOURCES, ERROR_ACCESS_DENIED, ERROR_SHARING_VIOLATION};
inline constexpr uint32_t kReading[] = {ERROR_IO_DEVICE, ERROR_LOCK_VIOLATION};
inline constexpr uint32_t kWriting[] = {ERROR_DISK_FULL, ERROR_IO_DEVICE};
inline constexpr uint32_t kRegistry[] = {ERROR_NO_SYSTEM_RESOURCES, ERROR_ACCESS_DENIED};
inline constexpr uint32_t kCrypto[] = {static_cast<uint32_t>(NTE_FAIL), static_cast<uint32_t>(NTE_NO_MEMORY)};
inline constexpr uint32_t kDecoding[] = {static_cast<uint32_t>(CRYPT_E_ASN1_MEMORY), ERROR_NOT_ENOUGH_MEMORY};
inline constexpr uint32_t kLibrary[] = {ERROR_NO_SYSTEM_RESOURCES, ERROR_BAD_EXE_FORMAT, ERROR_MOD_NOT_FOUND};
inline constexpr uint32_t kExport[] = {ERROR_PROC_NOT_FOUND};
inline constexpr uint32_t kNative[] = {0xC000009A, 0xC0000022};  // insufficient resources, access denied
inline constexpr uint32_t kTrust[] = {static_cast<uint32_t>(CRYPT_E_FILE_ERROR), ERROR_NOT_ENOUGH_MEMORY};
inline constexpr uint32_t kCounters[] = {0x800007D6, 0xC0000BBB};  // PDH_NO_DATA, PDH_MEMORY_ALLOCATION_FAILURE
inline constexpr uint32_t kNetwork[] = {12002, 12029, ERROR_NOT_ENOUGH_MEMORY};  // time-out, cannot connect
inline constexpr uint32_t kWbem[] = {0x80041001, 0x80041006};                    // failed, out of memory
inline constexpr uint32_t kTimer[] = {97};                                       // TIMERR_NOCANDO

}  // namespace faults

// CALL(name, library, how it fails, errors): imported through a pointer.
// PLAIN(name, library, how it fails, errors, parameters, arguments): its header does not say that it is imported.
// LOADED(name, library, how it fails, errors): found by its name while the program runs.
// METHOD(name, how it fails, errors): a method of a COM object; faulty_wmi.h stands before it.
#define ST_FAULT_TABLE(CALL, PLAIN, LOADED, METHOD)                                                                   \
  CALL(CopyFileW, "kernel32", kFalse, kWriting)                                                                       \
  CALL(CreateDirectoryW, "kernel32", kFalse, kPath)                                                                   \
  CALL(CreateEventW, "kernel32", kFalse, kAny)                                                                        \
  CALL(CreateFileMappingW, "kernel32", kFalse, kAny)                                                                  \
  CALL(CreateFileW, "kernel32", kInvalidHandle, kPath)                                                                \
  CALL(CreateThreadpoolTimer, "kernel32", kFalse, kAny)                                                               \
  CALL(CreateThreadpoolWork, "kernel32", kFalse, kAny)                                                                \
  CALL(DeleteFileW, "kernel32", kFalse, kPath)                                                                        \
  CALL(EnumResourceLanguagesExW, "kernel32", kFalse, kAny)                                                            \
  CALL(ExpandEnvironmentStringsW, "kernel32", kFalse, kAny)                                                           \
  CALL(FindFirstFileExW, "kernel32", kInvalidHandle, kPath)                                                           \
  CALL(FindFirstFileW, "kernel32", kInvalidHandle, kPath)                                                             \
  CALL(FindNextFileW, "kernel32", kFalse, kReading)                                                                   \
  CALL(FindResourceExW, "kernel32", kFalse, kAny)                                                                     \
  CALL(FindResourceW, "kernel32", kFalse, kAny)                                                                       \
  CALL(FlushFileBuffers, "kernel32", kFalse, kWriting)                                                                \
  CALL(FormatMessageW, "kernel32", kFalse, kAny)                                                                      \
  CALL(GetCurrentDirectoryW, "kernel32", kFalse, kAny)                                                                \
  CALL(GetDiskFreeSpaceExW, "kernel32", kFalse, kReading)                                                             \
  CALL(GetFileAttributesW, "kernel32", kInvalidHandle, kPath)                                                         \
  CALL(GetFileInformationByHandleEx, "kernel32", kFalse, kReading)                                                    \
  CALL(GetFileSizeEx, "kernel32", kFalse, kReading)                                                                   \
  CALL(GetFinalPathNameByHandleW, "kernel32", kFalse, kAny)                                                           \
  CALL(GetFirmwareEnvironmentVariableW, "kernel32", kFalse, kAny)                                                     \
  CALL(GetFullPathNameW, "kernel32", kFalse, kAny)                                                                    \
  CALL(GetLocaleInfoW, "kernel32", kFalse, kAny)                                                                      \
  CALL(GetLogicalDriveStringsW, "kernel32", kFalse, kAny)                                                             \
  CALL(GetModuleFileNameW, "kernel32", kFalse, kAny)                                                                  \
  CALL(GetModuleHandleExW, "kernel32", kFalse, kAny)                                                                  \
  CALL(GetProcAddress, "kernel32", kFalse, kExport)                                                                   \
  CALL(GetSystemDirectoryW, "kernel32", kFalse, kAny)                                                                 \
  CALL(GetTempPathW, "kernel32", kFalse, kAny)                                                                        \
  CALL(GetVolumeInformationW, "kernel32", kFalse, kReading)                                                           \
  CALL(GlobalMemoryStatusEx, "kernel32", kFalse, kAny)                                                                \
  CALL(IsWow64Process, "kernel32", kFalse, kAny)                                                                      \
  CALL(LoadLibraryExW, "kernel32", kFalse, kLibrary)                                                                  \
  CALL(LoadResource, "kernel32", kFalse, kAny)                                                                        \
  CALL(MapViewOfFile, "kernel32", kFalse, kAny)                                                                       \
  CALL(MoveFileExW, "kernel32", kFalse, kPath)                                                                        \
  CALL(OpenFileById, "kernel32", kInvalidHandle, kPath)                                                               \
  CALL(OpenProcess, "kernel32", kFalse, kAny)                                                                         \
  CALL(ReadFile, "kernel32", kFalse, kReading)                                                                        \
  CALL(RemoveDirectoryW, "kernel32", kFalse, kPath)                                                                   \
  CALL(SetConsoleCtrlHandler, "kernel32", kFalse, kAny)                                                               \
  CALL(SetEndOfFile, "kernel32", kFalse, kWriting)                                                                    \
  CALL(SetFileAttributesW, "kernel32", kFalse, kPath)                                                                 \
  CALL(SetFileInformationByHandle, "kernel32", kFalse, kWriting)                                                      \
  CALL(SetFilePointerEx, "kernel32", kFalse, kReading)                                                                \
  CALL(WriteFile, "kernel32", kFalse, kWriting)                                                                       \
  CALL(CreateWindowExW, "user32", kFalse, kAny)                                                                       \
  CALL(RegisterClassW, "user32", kFalse, kAny)                                                                        \
  CALL(timeBeginPeriod, "winmm", kCode, kTimer)                                                                       \
  CALL(ConvertSidToStringSidW, "advapi32", kFalse, kAny)                                                              \
  CALL(ConvertStringSecurityDescriptorToSecurityDescriptorW, "advapi32", kFalse, kAny)                                \
  CALL(CryptAcquireContextW, "advapi32", kFalse, kCrypto)                                                             \
  CALL(CryptDecrypt, "advapi32", kFalse, kCrypto)                                                                     \
  CALL(CryptEncrypt, "advapi32", kFalse, kCrypto)                                                                     \
  CALL(CryptExportKey, "advapi32", kFalse, kCrypto)                                                                   \
  CALL(CryptGenKey, "advapi32", kFalse, kCrypto)                                                                      \
  CALL(CryptImportKey, "advapi32", kFalse, kCrypto)                                                                   \
  CALL(CryptSetKeyParam, "advapi32", kFalse, kCrypto)                                                                 \
  CALL(GetTokenInformation, "advapi32", kFalse, kAny)                                                                 \
  CALL(LookupAccountSidW, "advapi32", kFalse, kAny)                                                                   \
  CALL(OpenEventLogW, "advapi32", kFalse, kAny)                                                                       \
  CALL(OpenProcessToken, "advapi32", kFalse, kAny)                                                                    \
  CALL(ReadEventLogW, "advapi32", kFalse, kReading)                                                                   \
  CALL(RegEnumKeyExW, "advapi32", kCode, kRegistry)                                                                   \
  CALL(RegEnumValueW, "advapi32", kCode, kRegistry)                                                                   \
  CALL(RegOpenKeyExW, "advapi32", kCode, kRegistry)                                                                   \
  CALL(RegQueryInfoKeyW, "advapi32", kCode, kRegistry)                                                                \
  CALL(RegQueryValueExW, "advapi32", kCode, kRegistry)                                                                \
  CALL(CryptDecodeObjectEx, "crypt32", kFalse, kDecoding)                                                             \
  CALL(CryptImportPublicKeyInfo, "crypt32", kFalse, kCrypto)                                                          \
  CALL(CryptStringToBinaryA, "crypt32", kFalse, kDecoding)                                                            \
  CALL(CertAddEncodedCertificateToStore, "crypt32", kFalse, kDecoding)                                                \
  CALL(CertCreateCertificateChainEngine, "crypt32", kFalse, kAny)                                                     \
  CALL(CertGetCertificateChain, "crypt32", kFalse, kAny)                                                              \
  CALL(CertOpenStore, "crypt32", kFalse, kAny)                                                                        \
  CALL(CertVerifyCertificateChainPolicy, "crypt32", kFalse, kAny)                                                     \
  CALL(CoCreateInstance, "ole32", kHresult, kAny)                                                                     \
  CALL(CoInitializeEx, "ole32", kHresult, kAny)                                                                       \
  CALL(CoInitializeSecurity, "ole32", kHresult, kAny)                                                                 \
  CALL(CoSetProxyBlanket, "ole32", kHresult, kAny)                                                                    \
  CALL(SafeArrayGetElement, "oleaut32", kHresult, kAny)                                                               \
  CALL(SysAllocStringLen, "oleaut32", kNothing, kAny)                                                                 \
  CALL(SHGetFolderPathW, "shell32", kHresult, kAny)                                                                   \
  PLAIN(SHGetKnownFolderPath, "shell32", kHresult, kAny,                                                              \
        (REFKNOWNFOLDERID folder, DWORD flags, HANDLE token, PWSTR * path), (folder, flags, token, path))             \
  PLAIN(GetAdaptersInfo, "iphlpapi", kCode, kAny, (PIP_ADAPTER_INFO adapters, PULONG size), (adapters, size))         \
  PLAIN(PdhOpenQueryW, "pdh", kCode, kCounters, (LPCWSTR source, DWORD_PTR user, PDH_HQUERY * query),                 \
        (source, user, query))                                                                                        \
  PLAIN(PdhAddCounterW, "pdh", kCode, kCounters,                                                                      \
        (PDH_HQUERY query, LPCWSTR path, DWORD_PTR user, PDH_HCOUNTER * counter), (query, path, user, counter))       \
  PLAIN(PdhCollectQueryData, "pdh", kCode, kCounters, (PDH_HQUERY query), (query))                                    \
  PLAIN(PdhGetFormattedCounterValue, "pdh", kCode, kCounters,                                                         \
        (PDH_HCOUNTER counter, DWORD format, LPDWORD type, PPDH_FMT_COUNTERVALUE value),                              \
        (counter, format, type, value))                                                                               \
  PLAIN(WinHttpOpen, "winhttp", kFalse, kNetwork,                                                                     \
        (LPCWSTR agent, DWORD access, LPCWSTR proxy, LPCWSTR bypass, DWORD flags),                                    \
        (agent, access, proxy, bypass, flags))                                                                        \
  PLAIN(WinHttpConnect, "winhttp", kFalse, kNetwork,                                                                  \
        (HINTERNET session, LPCWSTR host, INTERNET_PORT port, DWORD zero), (session, host, port, zero))               \
  PLAIN(WinHttpOpenRequest, "winhttp", kFalse, kNetwork,                                                              \
        (HINTERNET connection, LPCWSTR verb, LPCWSTR object, LPCWSTR version, LPCWSTR referrer, LPCWSTR * types,      \
         DWORD flags),                                                                                                \
        (connection, verb, object, version, referrer, types, flags))                                                  \
  PLAIN(WinHttpSetOption, "winhttp", kFalse, kNetwork, (HINTERNET handle, DWORD option, LPVOID buffer, DWORD length), \
        (handle, option, buffer, length))                                                                             \
  PLAIN(WinHttpSetTimeouts, "winhttp", kFalse, kNetwork,                                                              \
        (HINTERNET handle, int resolve, int connect, int send, int receive),                                          \
        (handle, resolve, connect, send, receive))                                                                    \
  PLAIN(WinHttpSendRequest, "winhttp", kFalse, kNetwork,                                                              \
        (HINTERNET request, LPCWSTR headers, DWORD headersLength, LPVOID body, DWORD bodyLength, DWORD total,         \
         DWORD_PTR context),                                                                                          \
        (request, headers, headersLength, body, bodyLength, total, context))                                          \
  PLAIN(WinHttpWriteData, "winhttp", kFalse, kNetwork,                                                                \
        (HINTERNET request, LPCVOID buffer, DWORD length, LPDWORD written), (request, buffer, length, written))       \
  PLAIN(WinHttpReceiveResponse, "winhttp", kFalse, kNetwork, (HINTERNET request, LPVOID zero), (request, zero))       \
  PLAIN(WinHttpReadData, "winhttp", kFalse, kNetwork, (HINTERNET request, LPVOID buffer, DWORD length, LPDWORD read), \
        (request, buffer, length, read))                                                                              \
  PLAIN(WinHttpQueryHeaders, "winhttp", kFalse, kNetwork,                                                             \
        (HINTERNET request, DWORD level, LPCWSTR name, LPVOID buffer, LPDWORD length, LPDWORD index),                 \
        (request, level, name, buffer, length, index))                                                                \
  PLAIN(WinHttpQueryOption, "winhttp", kFalse, kNetwork,                                                              \
        (HINTERNET handle, DWORD option, LPVOID buffer, LPDWORD length), (handle, option, buffer, length))            \
  LOADED(BCryptOpenAlgorithmProvider, "bcrypt", kNtStatus, kNative)                                                   \
  LOADED(BCryptGetProperty, "bcrypt", kNtStatus, kNative)                                                             \
  LOADED(BCryptCreateHash, "bcrypt", kNtStatus, kNative)                                                              \
  LOADED(BCryptHashData, "bcrypt", kNtStatus, kNative)                                                                \
  LOADED(BCryptFinishHash, "bcrypt", kNtStatus, kNative)                                                              \
  LOADED(NtQuerySystemInformation, "ntdll", kNtStatus, kNative)                                                       \
  LOADED(NtQueryObject, "ntdll", kNtStatus, kNative)                                                                  \
  LOADED(MiniDumpWriteDump, "dbghelp", kFalse, kWriting)                                                              \
  LOADED(WinVerifyTrust, "wintrust", kCode, kTrust)                                                                   \
  LOADED(CryptCATAdminCalcHashFromFileHandle, "wintrust", kFalse, kReading)                                           \
  METHOD(IWbemLocator_ConnectServer, kWmi, kWbem)                                                                     \
  METHOD(IWbemServices_ExecQuery, kWmi, kWbem)                                                                        \
  METHOD(IWbemServices_GetObject, kWmi, kWbem)                                                                        \
  METHOD(IEnumWbemClassObject_Next, kWmi, kWbem)                                                                      \
  METHOD(IWbemClassObject_Get, kWmi, kWbem)

namespace faults {

struct CallRow {
  const char* name;
  const char* library;  // of the system; empty for a method
  FailsAs failsAs;
  std::span<const uint32_t> errors;
};

#define ST_FAULT_ROW(name, library, failsAs, errors, ...) {#name, library, FailsAs::failsAs, errors},
#define ST_FAULT_METHOD_ROW(name, failsAs, errors) {#name, "", FailsAs::failsAs, errors},
inline constexpr CallRow kCalls[] = {ST_FAULT_TABLE(ST_FAULT_ROW, ST_FAULT_ROW, ST_FAULT_ROW, ST_FAULT_METHOD_ROW)};
#undef ST_FAULT_ROW
#undef ST_FAULT_METHOD_ROW
inline constexpr size_t kCallCount = std::size(kCalls);

// The number of a row: faults::row::CreateFileW_.
namespace row {
#define ST_FAULT_NUMBER(name, ...) name##_,
enum Number : size_t { ST_FAULT_TABLE(ST_FAULT_NUMBER, ST_FAULT_NUMBER, ST_FAULT_NUMBER, ST_FAULT_NUMBER) };
#undef ST_FAULT_NUMBER
}  // namespace row

}  // namespace faults
