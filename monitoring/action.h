// What a fired trigger does.
#pragma once

#include <windows.h>

#include <json/value.h>

#include <atomic>
#include <functional>
#include <memory>
#include <string>

#include "monitoring/configuration.h"
#include "monitoring/dump_budget.h"

namespace st::monitoring {

// Writes a minidump of a process to a file open for reading and writing; 0 or the system's error code.
using MiniDumpWriter = std::function<DWORD(HANDLE process, DWORD processId, HANDLE file)>;

// What the actions of one run share. All of it outlives them.
struct ActionContext {
  DumpBudget& budget;
  const std::atomic<bool>& stop;  // somebody wants monitoring to end: nothing more is begun
  MiniDumpWriter writeDump;
};

class Action {
 public:
  // From an element of "actions". Empty, and logged, when the element is not as it has to be.
  static std::shared_ptr<Action> Create(const Json::Value& json, const ActionContext& context);

  // Runs to its end on the calling thread; logs every failure and throws nothing on purpose. Several threads may run
  // one action at the same time. This one only logs; each kind calls it first.
  virtual void Run();
  virtual ~Action() = default;
  Action(const Action&) = delete;
  Action& operator=(const Action&) = delete;

  const std::wstring& Id() const { return m_settings.id; }

 protected:
  explicit Action(ActionSettings settings) : m_settings(std::move(settings)) {}
  const Json::Value& Parameters() const { return m_settings.parameters; }
  std::wstring ParametersText() const;

 private:
  const ActionSettings m_settings;
};

}  // namespace st::monitoring
