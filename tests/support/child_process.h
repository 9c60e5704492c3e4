// A program that a test starts: its output can be read line by line while it runs, and it is ended and waited for when
// the object goes.
#pragma once

#include <windows.h>

#include <stdexcept>
#include <string>

#include "core/scoped.h"

class ChildProcess {
 public:
  // `commandLine` begins with the program's full path in double quotes. The program's standard output comes here.
  explicit ChildProcess(std::wstring commandLine) {
    SECURITY_ATTRIBUTES inherited{sizeof inherited, nullptr, TRUE};
    KernelHandle writer;
    if (!CreatePipe(m_output.Receive(), writer.Receive(), &inherited, 0)) throw std::runtime_error("no pipe");
    SetHandleInformation(m_output.Get(), HANDLE_FLAG_INHERIT, 0);
    STARTUPINFOW startup{};
    startup.cb = sizeof startup;
    startup.dwFlags = STARTF_USESTDHANDLES;
    startup.hStdOutput = writer.Get();
    startup.hStdError = GetStdHandle(STD_ERROR_HANDLE);
    PROCESS_INFORMATION process{};
    if (!CreateProcessW(nullptr, commandLine.data(), nullptr, nullptr, TRUE, 0, nullptr, nullptr, &startup, &process)) {
      throw std::runtime_error("a child program cannot be started");
    }
    m_process.Reset(process.hProcess);
    m_id = process.dwProcessId;
    CloseThread(process.hThread);
  }
  ~ChildProcess() { Kill(); }
  ChildProcess(const ChildProcess&) = delete;
  ChildProcess& operator=(const ChildProcess&) = delete;

  DWORD Id() const { return m_id; }

  // The next line without its end; what is left when the output ends, and then nothing.
  std::string ReadLine() {
    std::string line;
    for (char c = 0; Read(c) && c != '\n';) {
      if (c != '\r') line += c;
    }
    return line;
  }

  std::string ReadAll() {
    std::string text;
    for (char c = 0; Read(c);) {
      if (c != '\r') text += c;
    }
    return text;
  }

  // Ends the program at once, as the task manager does.
  void Kill() {
    TerminateProcess(m_process.Get(), 1);
    Wait();
  }

  // Waits for the program's end; its exit code.
  DWORD Wait() {
    DWORD code = 0;
    WaitForSingleObject(m_process.Get(), INFINITE);
    GetExitCodeProcess(m_process.Get(), &code);
    return code;
  }

 private:
  static void CloseThread(HANDLE thread) { const KernelHandle owner(thread); }

  bool Read(char& c) {
    DWORD count = 0;
    return ReadFile(m_output.Get(), &c, 1, &count, nullptr) && count == 1;
  }

  KernelHandle m_output;
  KernelHandle m_process;
  DWORD m_id = 0;
};
