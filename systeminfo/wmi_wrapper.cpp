#include "systeminfo/wmi_wrapper.h"

#include <utility>

#include "core/logging.h"
#include "systeminfo/variant_to_json.h"

namespace {

constexpr wchar_t kInit[] = L"WMIWrapper::Init";
constexpr wchar_t kExecuteQuery[] = L"WMIWrapper::ExecuteQuery";
constexpr LONG kStopPoll = 250;  // milliseconds between two looks whether to stop waiting

// Logs a failed step of Init; `format` takes the status.
bool Succeeded(HRESULT status, const wchar_t* format) {
  if (FAILED(status)) LOG_ERROR(kInit, format, static_cast<unsigned>(status));
  return SUCCEEDED(status);
}

// Calls store(name, value) for each property that can be read, and failed(name, status) for each that cannot.
template <class Store, class Failed>
void ReadProperties(IWbemClassObject& instance, const WMIWrapper::Names& names, Store store, Failed failed) {
  for (const std::wstring& name : names) {
    ScopedVariant variant;
    const HRESULT status = instance.Get(name.c_str(), 0, variant.Receive(), nullptr, nullptr);
    if (FAILED(status)) {
      failed(name, status);
    } else {
      store(name, VariantToJsonValue(variant.Get()));
    }
  }
}

void ReadRow(IWbemClassObject& instance, const WMIWrapper::Names& names, WMIWrapper::Row& row) {
  ReadProperties(
      instance, names, [&row](const std::wstring& name, Json::Value value) { row[name] = std::move(value); },
      [](const std::wstring&, HRESULT status) {
        LOG_ERROR(kExecuteQuery, L"IWbemClassObject->Get failed with message %s", WbemErrorName(status));
      });
}

}  // namespace

WMIWrapper::~WMIWrapper() {
  m_services.Reset();
  m_locator.Reset();
  CoUninitialize();
}

int WMIWrapper::Init() {
  if (Connect()) return 0;
  m_services.Reset();
  m_locator.Reset();
  return 1;
}

bool WMIWrapper::Connect() {
  if (!Succeeded(CoInitializeEx(nullptr, COINIT_MULTITHREADED), L"Failed to initialize COM library. Error code = %x")) {
    return false;
  }
  if (!Succeeded(m_initializeSecurity(nullptr, -1, nullptr, nullptr, RPC_C_AUTHN_LEVEL_DEFAULT,
                                      RPC_C_IMP_LEVEL_IMPERSONATE, nullptr, EOAC_NONE, nullptr),
                 L"Failed to initialize security. Error code = %x")) {
    return false;
  }
  if (!Succeeded(
          CoCreateInstance(CLSID_WbemLocator, nullptr, CLSCTX_INPROC_SERVER, IID_IWbemLocator, m_locator.ReceiveVoid()),
          L"Failed to create IWbemLocator object. Err code = %x")) {
    return false;
  }
  const ScopedBstr space = MakeBstr(L"ROOT\\CIMV2");
  if (!space) return Succeeded(E_OUTOFMEMORY, L"No memory for the namespace. Error code = %x");
  if (!Succeeded(
          m_locator->ConnectServer(space.Get(), nullptr, nullptr, nullptr, 0, nullptr, nullptr, m_services.Receive()),
          L"Coult not connect to server. Error code = %x")) {
    return false;
  }
  return Succeeded(CoSetProxyBlanket(m_services.Get(), RPC_C_AUTHN_WINNT, RPC_C_AUTHZ_NONE, nullptr,
                                     RPC_C_AUTHN_LEVEL_CALL, RPC_C_IMP_LEVEL_IMPERSONATE, nullptr, EOAC_NONE),
                   L"Could not set proxy blanket. Error code = %x");
}

// Waits for the next instance without a limit, but in steps when somebody may want it to stop.
HRESULT WMIWrapper::Next(IEnumWbemClassObject& instances, ComPtr<IWbemClassObject>& instance, ULONG& returned) const {
  HRESULT status = WBEM_S_NO_ERROR;
  do {
    status = instances.Next(m_stop == nullptr ? static_cast<LONG>(WBEM_INFINITE) : kStopPoll, 1, instance.Receive(),
                            &returned);
  } while (status == WBEM_S_TIMEDOUT && m_stop != nullptr && !*m_stop);
  return status;
}

int WMIWrapper::VisitInstances(const std::wstring& query, bool onlyFirst, const InstanceVisitor& visit) {
  if (!m_services) {
    LOG_ERROR(kExecuteQuery, L"Invalid pSvc pointer; query %s", query.c_str());
    return 1;
  }
  const ScopedBstr language = MakeBstr(L"WQL");
  const ScopedBstr text = MakeBstr(query);
  if (!language || !text) {
    LOG_ERROR(kExecuteQuery, L"Query %s failed. Error code %x", query.c_str(), static_cast<unsigned>(E_OUTOFMEMORY));
    return 1;
  }
  ComPtr<IEnumWbemClassObject> instances;
  HRESULT status = m_services->ExecQuery(
      language.Get(), text.Get(), WBEM_FLAG_FORWARD_ONLY | WBEM_FLAG_RETURN_IMMEDIATELY, nullptr, instances.Receive());
  while (SUCCEEDED(status) && instances) {
    ComPtr<IWbemClassObject> instance;
    ULONG returned = 0;
    status = Next(*instances.Get(), instance, returned);
    if (FAILED(status) || returned == 0 || !instance) break;
    visit(*instance.Get());
    if (onlyFirst) break;
  }
  // ExecQuery returns at once, so a query that WMI cannot run at all may fail only in Next. A Next that gave up waiting
  // calls itself a success, but there may be instances behind it.
  if (FAILED(status) || status == WBEM_S_TIMEDOUT) {
    LOG_ERROR(kExecuteQuery, L"Query %s failed. Error code %x", query.c_str(), static_cast<unsigned>(status));
    return 1;
  }
  return 0;
}

int WMIWrapper::ExecuteQuery(const std::wstring& query, const Names& names, Row& row) {
  return VisitInstances(query, true, [&](IWbemClassObject& instance) { ReadRow(instance, names, row); });
}

int WMIWrapper::ExecuteQuery(const std::wstring& query, const Names& names, Rows& rows) {
  return VisitInstances(query, false,
                        [&](IWbemClassObject& instance) { ReadRow(instance, names, rows.emplace_back()); });
}

int WMIWrapper::ExecuteQuery(const std::wstring& query, const Names& names, Table& table) {
  return VisitInstances(query, false, [&](IWbemClassObject& instance) {
    std::vector<Json::Value> row;
    ReadProperties(
        instance, names, [&row](const std::wstring&, Json::Value value) { row.push_back(std::move(value)); },
        [](const std::wstring& name, HRESULT status) {
          LOG_ERROR(kExecuteQuery, L"IWbemClassObject->Get(%s) failed with message %s", name.c_str(),
                    WbemErrorName(status));
        });
    table.push_back(std::move(row));
  });
}

WMIWrapper::Names WMIWrapper::PropertiesOf(const std::wstring& className, const Names& names) {
  const ScopedBstr path = MakeBstr(className);
  ComPtr<IWbemClassObject> definition;
  if (!m_services || !path) return names;
  const HRESULT status = m_services->GetObject(path.Get(), 0, nullptr, definition.Receive(), nullptr);
  if (FAILED(status) || !definition) {
    LOG_WARNING(L"WMIWrapper::PropertiesOf", L"The class %s cannot be asked. Error code %x", className.c_str(),
                static_cast<unsigned>(status));
    return names;
  }
  Names known;
  for (const std::wstring& name : names) {
    ScopedVariant ignored;
    if (definition->Get(name.c_str(), 0, ignored.Receive(), nullptr, nullptr) != static_cast<HRESULT>(WBEM_E_NOT_FOUND))
      known.push_back(name);
  }
  return known;
}

const wchar_t* WbemErrorName(HRESULT code) {
  switch (static_cast<unsigned>(code)) {
    case 0:
      return L"WBEM_S_NO_ERROR";
    case 0x80041001:
      return L"WBEM_E_FAILED";
    case 0x80041002:
      return L"WBEM_E_NOT_FOUND";
    case 0x80041006:
      return L"WBEM_E_OUT_OF_MEMORY";
    case 0x80041008:
      return L"WBEM_E_INVALID_PARAMETER";
    default:
      return L"Invalid return code";
  }
}
