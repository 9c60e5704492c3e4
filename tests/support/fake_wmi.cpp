#include "tests/support/fake_wmi.h"

#include <gtest/gtest.h>

#include <utility>

#include "tests/support/wmi_stubs.h"

namespace fake_wmi {
namespace {

class FakeObject : public WbemClassObjectStub {
 public:
  explicit FakeObject(Instance instance) : m_instance(std::move(instance)) {}

  HRESULT STDMETHODCALLTYPE Get(LPCWSTR name, LONG, VARIANT* value, CIMTYPE*, LONG*) override {
    const auto found = m_instance.find(name);
    if (found == m_instance.end()) return WBEM_E_NOT_FOUND;
    return found->second(value);
  }

 private:
  Instance m_instance;
};

class FakeEnumerator : public WbemEnumeratorStub {
 public:
  FakeEnumerator(Answer answer, int& nextCalls) : m_answer(std::move(answer)), m_nextCalls(nextCalls) {}

  HRESULT STDMETHODCALLTYPE Next(LONG milliseconds, ULONG count, IWbemClassObject** objects, ULONG* returned) override {
    EXPECT_EQ(count, 1u);
    ++m_nextCalls;
    *returned = 0;
    if (m_next == m_answer.instances.size()) return m_answer.end ? m_answer.end(milliseconds) : m_answer.endStatus;
    *objects = new FakeObject(m_answer.instances[m_next++]);
    *returned = 1;
    return WBEM_S_NO_ERROR;
  }

 private:
  Answer m_answer;
  int& m_nextCalls;
  size_t m_next = 0;
};

class FakeServices : public WbemServicesStub {
 public:
  explicit FakeServices(FakeWmi& wmi) : m_wmi(wmi) {}

  HRESULT STDMETHODCALLTYPE ExecQuery(const BSTR language, const BSTR query, LONG flags, IWbemContext*,
                                      IEnumWbemClassObject** enumerator) override {
    EXPECT_STREQ(language, L"WQL");
    EXPECT_EQ(flags, WBEM_FLAG_FORWARD_ONLY | WBEM_FLAG_RETURN_IMMEDIATELY);
    m_wmi.queries.emplace_back(query);
    const Answer answer = m_wmi.answers[query];
    if (answer.whenQueried) answer.whenQueried();
    if (SUCCEEDED(answer.queryStatus) && answer.hasEnumerator)
      *enumerator = new FakeEnumerator(answer, m_wmi.nextCalls);
    return answer.queryStatus;
  }

 private:
  FakeWmi& m_wmi;
};

}  // namespace

Property Text(std::wstring text) {
  return [text = std::move(text)](VARIANT* value) {
    value->vt = VT_BSTR;
    value->bstrVal = MakeBstr(text).Release();
    return WBEM_S_NO_ERROR;
  };
}

Property Number(int32_t number) {
  return [number](VARIANT* value) {
    value->vt = VT_I4;
    value->lVal = number;
    return WBEM_S_NO_ERROR;
  };
}

Property Flag(bool flag) {
  return [flag](VARIANT* value) {
    value->vt = VT_BOOL;
    value->boolVal = flag ? VARIANT_TRUE : VARIANT_FALSE;
    return WBEM_S_NO_ERROR;
  };
}

Property Nothing() {
  return [](VARIANT* value) {
    value->vt = VT_NULL;
    return WBEM_S_NO_ERROR;
  };
}

Property Failure(HRESULT status) {
  return [status](VARIANT*) { return status; };
}

}  // namespace fake_wmi

FakeWmi::~FakeWmi() {
  EXPECT_EQ(WbemServicesStub::Live() + WbemEnumeratorStub::Live() + WbemClassObjectStub::Live(), 0)
      << "an interface was not released";
}

ComPtr<IWbemServices> FakeWmi::Services() {
  return ComPtr<IWbemServices>(new fake_wmi::FakeServices(*this));
}
