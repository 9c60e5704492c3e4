#include "tests/faults/faulty_wmi.h"

#include "core/com.h"
#include "tests/faults/fault_layer.h"
#include "tests/support/wmi_stubs.h"

namespace faults {
namespace {

class FaultyObject : public WbemClassObjectStub {
 public:
  explicit FaultyObject(IWbemClassObject* object) : m_object(object) {}

  HRESULT STDMETHODCALLTYPE Get(LPCWSTR name, LONG flags, VARIANT* value, CIMTYPE* type, LONG* flavour) override {
    if (const uint32_t error = ErrorOfCall(row::IWbemClassObject_Get_)) return static_cast<HRESULT>(error);
    return m_object->Get(name, flags, value, type, flavour);
  }

 private:
  const ComPtr<IWbemClassObject> m_object;
};

class FaultyEnumerator : public WbemEnumeratorStub {
 public:
  explicit FaultyEnumerator(IEnumWbemClassObject* instances) : m_instances(instances) {}

  HRESULT STDMETHODCALLTYPE Next(LONG timeout, ULONG count, IWbemClassObject** objects, ULONG* returned) override {
    if (const uint32_t error = ErrorOfCall(row::IEnumWbemClassObject_Next_)) return static_cast<HRESULT>(error);
    const HRESULT status = m_instances->Next(timeout, count, objects, returned);
    for (ULONG i = 0; SUCCEEDED(status) && i < *returned; ++i)
      objects[i] = new FaultyObject(objects[i]);
    return status;
  }

 private:
  const ComPtr<IEnumWbemClassObject> m_instances;
};

class FaultyServices : public WbemServicesStub {
 public:
  explicit FaultyServices(IWbemServices* services) : m_services(services) {}

  HRESULT STDMETHODCALLTYPE ExecQuery(const BSTR language, const BSTR query, LONG flags, IWbemContext* context,
                                      IEnumWbemClassObject** instances) override {
    if (const uint32_t error = ErrorOfCall(row::IWbemServices_ExecQuery_)) return static_cast<HRESULT>(error);
    const HRESULT status = m_services->ExecQuery(language, query, flags, context, instances);
    if (SUCCEEDED(status) && *instances != nullptr) *instances = new FaultyEnumerator(*instances);
    return status;
  }

  HRESULT STDMETHODCALLTYPE GetObject(const BSTR path, LONG flags, IWbemContext* context, IWbemClassObject** object,
                                      IWbemCallResult** result) override {
    if (const uint32_t error = ErrorOfCall(row::IWbemServices_GetObject_)) return static_cast<HRESULT>(error);
    const HRESULT status = m_services->GetObject(path, flags, context, object, result);
    if (SUCCEEDED(status) && object != nullptr && *object != nullptr) *object = new FaultyObject(*object);
    return status;
  }

  IWbemServices* Real() const { return m_services.Get(); }

 private:
  const ComPtr<IWbemServices> m_services;
};

class FaultyLocator : public CountedObject<IWbemLocator> {
 public:
  explicit FaultyLocator(IWbemLocator* locator) : m_locator(locator) {}

  HRESULT STDMETHODCALLTYPE ConnectServer(const BSTR resource, const BSTR user, const BSTR password, const BSTR locale,
                                          LONG flags, const BSTR authority, IWbemContext* context,
                                          IWbemServices** services) override {
    if (const uint32_t error = ErrorOfCall(row::IWbemLocator_ConnectServer_)) return static_cast<HRESULT>(error);
    const HRESULT status =
        m_locator->ConnectServer(resource, user, password, locale, flags, authority, context, services);
    if (SUCCEEDED(status)) *services = new FaultyServices(*services);
    return status;
  }

 private:
  const ComPtr<IWbemLocator> m_locator;
};

}  // namespace

HRESULT WrapLocator(HRESULT status, REFCLSID, IUnknown*, DWORD, REFIID interfaceId, void** object) {
  if (SUCCEEDED(status) && interfaceId == IID_IWbemLocator) {
    *object = static_cast<IWbemLocator*>(new FaultyLocator(static_cast<IWbemLocator*>(*object)));
  }
  return status;
}

IUnknown* RealServices(IUnknown* services) {
  return static_cast<FaultyServices*>(services)->Real();
}

}  // namespace faults
