// A browser of the engine's own: started without a window, with a fresh profile folder that only this user may enter.
// It ends with this object, or with this process, however that ends; its profile goes with it.
#pragma once

#include <windows.h>

#include <memory>
#include <string>
#include <thread>

#include "companions/engine/transport.h"
#include "core/scoped.h"

namespace engine {

class BrowserProcess {
 public:
  BrowserProcess() = default;
  ~BrowserProcess() { End(); }
  BrowserProcess(const BrowserProcess&) = delete;
  BrowserProcess& operator=(const BrowserProcess&) = delete;

  // Starts it; does not wait. A Windows browser gets pipes unless `usePort`. False, and `error` says why.
  bool Start(const std::wstring& program, bool usePort, std::wstring& error);

  // Waits until the browser can be talked to. Null, and `error` says why, after some seconds or when it ended.
  std::unique_ptr<Transport> Connect(std::wstring& error);

  bool UsesPort() const { return m_usesPort; }
  bool RunsWithoutSandbox() const { return m_runsWithoutSandbox; }
  bool HasEnded() const;

  // At once. Waits some seconds at most for the profile to be deleted.
  void End() noexcept;

 private:
  struct Pipes;

  bool MakeProfile(const std::wstring& program, std::wstring& error);
  bool MakeJob();
  bool CreateInJob(std::wstring commandLine, const Pipes& pipes, std::wstring& error);
  void BeginUnixLife();
  std::wstring LastWords() const;

  std::wstring m_profile;
  std::wstring m_mark;  // path, beside the profile: file that the system deletes when this process ends
  KernelHandle m_markHandle;
  bool m_isUnix = false;
  bool m_usesPort = false;
  bool m_runsWithoutSandbox = false;
  bool m_isStarted = false;
  KernelHandle m_job;      // closing its last handle ends all processes in it
  KernelHandle m_process;  // invalid for a Unix program
  KernelHandle m_fromBrowser;
  KernelHandle m_toBrowser;
  KernelHandle m_lifeEnds;  // event
  std::thread m_lifeThread;
};

}  // namespace engine
