// The WMI objects of the system with the fault layer before those of their methods that the program calls.
#pragma once

#include <windows.h>

#include <wbemidl.h>

namespace faults {

// To be called with the result and the arguments of CoCreateInstance; puts a locator of ours before the system's.
HRESULT WrapLocator(HRESULT status, REFCLSID classId, IUnknown* outer, DWORD context, REFIID interfaceId,
                    void** object);

// The system's services behind those that a locator of ours gave.
IUnknown* RealServices(IUnknown* services);

}  // namespace faults
