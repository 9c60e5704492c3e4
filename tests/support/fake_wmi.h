// A WMI whose answers a test sets: COM objects behind IWbemServices, for what no machine can be made to answer. Handed
// to a WMIWrapper by its constructor:
//   FakeWmi wmi;
//   wmi.answers[L"SELECT * FROM Win32_Battery"].instances = {{{L"Name", fake_wmi::Text(L"BAT0")}}};
//   auto wrapper = std::make_shared<WMIWrapper>(wmi.Services());
#pragma once

#include <windows.h>

#include <wbemidl.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "core/com.h"

namespace fake_wmi {

using Property = std::function<HRESULT(VARIANT* value)>;  // what IWbemClassObject::Get does for it
using Instance = std::map<std::wstring, Property>;        // Get of a name that is not there: WBEM_E_NOT_FOUND

struct Answer {
  HRESULT queryStatus = WBEM_S_NO_ERROR;
  bool hasEnumerator = true;
  std::vector<Instance> instances;
  HRESULT endStatus = WBEM_S_FALSE;  // of the Next behind the last instance
  // For a peer that does not answer: called by ExecQuery, and in the place of endStatus with Next's time limit.
  std::function<void()> whenQueried;
  std::function<HRESULT(LONG milliseconds)> end;
};

Property Text(std::wstring text);
Property Number(int32_t number);  // VT_I4
Property Flag(bool flag);         // VT_BOOL
Property Nothing();               // VT_NULL: there is such a property, without a value
Property Failure(HRESULT status);

}  // namespace fake_wmi

// Must outlive the services that it hands out.
class FakeWmi {
 public:
  ~FakeWmi();

  ComPtr<IWbemServices> Services();

  std::map<std::wstring, fake_wmi::Answer> answers;  // by query; an unknown one matches nothing
  std::vector<std::wstring> queries;                 // as they came
  int nextCalls = 0;
};
