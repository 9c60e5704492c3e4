#include "systeminfo/wmi_wrapper.h"

#include <gmock/gmock.h>

#include <thread>

#include "core/logging.h"
#include "core/scope_exit.h"
#include "tests/support/fake_wmi.h"
#include "tests/support/wmi_stubs.h"

namespace {

using fake_wmi::Failure;
using fake_wmi::Number;
using fake_wmi::Text;
using testing::ElementsAre;
using testing::IsEmpty;

const WMIWrapper::Names kNames = {L"Name", L"Size"};

class WmiQuery : public testing::Test {
 protected:
  FakeWmi m_fake;
  WMIWrapper m_wmi{m_fake.Services()};
  logging::ErrorCapture m_errors;
  fake_wmi::Answer& m_answer = m_fake.answers[L"Q"];
};

TEST_F(WmiQuery, EachFormKeepsWhatWasThereAndAddsItsRows) {
  m_answer.instances = {{{L"Name", Text(L"a")}, {L"Size", Number(1)}, {L"Unwanted", Number(9)}},
                        {{L"Name", Text(L"b")}, {L"Size", Number(2)}}};
  WMIWrapper::Row row = {{L"Before", 7}};
  EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, row), 0);
  EXPECT_EQ(row, (WMIWrapper::Row{{L"Before", 7}, {L"Name", "a"}, {L"Size", 1u}}));
  EXPECT_EQ(m_fake.nextCalls, 1) << "the single-row form asks for one instance only";

  WMIWrapper::Rows rows(1);
  EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, rows), 0);
  EXPECT_THAT(rows, ElementsAre(WMIWrapper::Row{}, WMIWrapper::Row{{L"Name", "a"}, {L"Size", 1u}},
                                WMIWrapper::Row{{L"Name", "b"}, {L"Size", 2u}}));

  WMIWrapper::Table table(1);
  EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, table), 0);
  EXPECT_THAT(table, ElementsAre(IsEmpty(), ElementsAre("a", 1u), ElementsAre("b", 2u)));
  EXPECT_THAT(m_errors.Take(), IsEmpty());
}

TEST_F(WmiQuery, NothingFoundIsSuccessWithoutRows) {
  for (const bool hasEnumerator : {true, false}) {
    m_answer.hasEnumerator = hasEnumerator;
    WMIWrapper::Row row;
    WMIWrapper::Rows rows;
    WMIWrapper::Table table;
    EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, row), 0);
    EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, rows), 0);
    EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, table), 0);
    EXPECT_TRUE(row.empty() && rows.empty() && table.empty());
  }
  EXPECT_THAT(m_errors.Take(), IsEmpty());
}

TEST_F(WmiQuery, PropertyThatCannotBeReadIsLoggedAndLeftOut) {
  m_answer.instances = {{{L"Size", Number(1)}}, {{L"Name", Text(L"b")}, {L"Size", Failure(WBEM_E_FAILED)}}};
  WMIWrapper::Rows rows;
  EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, rows), 0);
  EXPECT_THAT(rows, ElementsAre(WMIWrapper::Row{{L"Size", 1u}}, WMIWrapper::Row{{L"Name", "b"}}));
  EXPECT_THAT(m_errors.Take(),
              ElementsAre(L"WMIWrapper::ExecuteQuery: IWbemClassObject->Get failed with message WBEM_E_NOT_FOUND",
                          L"WMIWrapper::ExecuteQuery: IWbemClassObject->Get failed with message WBEM_E_FAILED"));

  WMIWrapper::Table table;
  EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, table), 0);
  EXPECT_THAT(table, ElementsAre(ElementsAre(1u), ElementsAre("b")));
  EXPECT_THAT(m_errors.Take(),
              ElementsAre(L"WMIWrapper::ExecuteQuery: IWbemClassObject->Get(Name) failed with message WBEM_E_NOT_FOUND",
                          L"WMIWrapper::ExecuteQuery: IWbemClassObject->Get(Size) failed with message WBEM_E_FAILED"));
}

TEST_F(WmiQuery, FailureIsLoggedAndKeepsTheRowsBeforeIt) {
  WMIWrapper::Table table;
  m_answer.queryStatus = WBEM_E_INVALID_QUERY;
  EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, table), 1);
  EXPECT_THAT(m_errors.Take(), ElementsAre(L"WMIWrapper::ExecuteQuery: Query Q failed. Error code 80041017"));

  m_answer.queryStatus = WBEM_S_NO_ERROR;
  m_answer.instances = {{{L"Name", Text(L"a")}, {L"Size", Number(1)}}};
  const std::pair<HRESULT, std::wstring> ends[] = {{WBEM_E_INVALID_CLASS, L"80041010"}, {WBEM_S_TIMEDOUT, L"40004"}};
  for (const auto& [status, code] : ends) {
    m_answer.endStatus = status;
    table.clear();
    EXPECT_EQ(m_wmi.ExecuteQuery(L"Q", kNames, table), 1);
    EXPECT_THAT(m_errors.Take(), ElementsAre(L"WMIWrapper::ExecuteQuery: Query Q failed. Error code " + code));
    EXPECT_THAT(table, ElementsAre(ElementsAre("a", 1u)));
  }
}

TEST(WMIWrapper, QueryWithoutConnectionFails) {
  logging::ErrorCapture errors;
  WMIWrapper wmi;
  WMIWrapper::Row row;
  EXPECT_EQ(wmi.ExecuteQuery(L"SELECT 1", kNames, row), 1);
  EXPECT_THAT(errors.Take(), ElementsAre(L"WMIWrapper::ExecuteQuery: Invalid pSvc pointer; query SELECT 1"));
}

TEST(WMIWrapper, ThreadThatIsInAnotherApartmentCannotConnect) {
  logging::ErrorCapture errors;
  std::thread([] {
    ASSERT_EQ(CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED), S_OK);
    WMIWrapper wmi;
    EXPECT_EQ(wmi.Init(), 1);
  }).join();
  EXPECT_THAT(errors.Take(), ElementsAre(L"WMIWrapper::Init: Failed to initialize COM library. Error code = 80010106"));
}

// How far a connection gets. What is not said to fail succeeds, but for the last step: no fake is a proxy.
struct Connection {
  HRESULT security = S_OK;
  HRESULT create = S_OK;
  HRESULT connect = S_OK;
};

class FakeLocator : public CountedObject<IWbemLocator> {
 public:
  FakeLocator(FakeWmi& wmi, HRESULT status) : m_wmi(wmi), m_status(status) {}

  HRESULT STDMETHODCALLTYPE ConnectServer(const BSTR space, const BSTR, const BSTR, const BSTR, LONG, const BSTR,
                                          IWbemContext*, IWbemServices** services) override {
    EXPECT_STREQ(space, L"ROOT\\CIMV2");
    if (SUCCEEDED(m_status)) *services = m_wmi.Services().Release();
    return m_status;
  }

 private:
  FakeWmi& m_wmi;
  const HRESULT m_status;
};

// What the thread's apartment makes locators with while one is registered.
class FakeLocatorFactory : public CountedObject<IClassFactory> {
 public:
  FakeLocatorFactory(FakeWmi& wmi, const Connection& connection) : m_wmi(wmi), m_connection(connection) {}

  HRESULT STDMETHODCALLTYPE QueryInterface(REFIID id, void** object) override {
    if (id != IID_IUnknown && id != IID_IClassFactory) return CountedObject::QueryInterface(id, object);
    AddRef();
    *object = static_cast<IClassFactory*>(this);
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE CreateInstance(IUnknown*, REFIID, void** object) override {
    *object = nullptr;
    if (SUCCEEDED(m_connection.create)) {
      *object = static_cast<IWbemLocator*>(new FakeLocator(m_wmi, m_connection.connect));
    }
    return m_connection.create;
  }
  HRESULT STDMETHODCALLTYPE LockServer(BOOL) override { return S_OK; }

 private:
  FakeWmi& m_wmi;
  const Connection m_connection;
};

template <HRESULT status>
HRESULT WINAPI SecurityThatReturns(PSECURITY_DESCRIPTOR, LONG, SOLE_AUTHENTICATION_SERVICE*, void*, DWORD, DWORD, void*,
                                   DWORD, void*) {
  return status;
}

// On a thread that is in the multithreaded apartment.
void ExpectFailedInit(FakeWmi& wmi, const Connection& connection, const std::wstring& line) {
  const ComPtr<IClassFactory> factory(new FakeLocatorFactory(wmi, connection));
  DWORD registration = 0;
  ASSERT_EQ(
      CoRegisterClassObject(CLSID_WbemLocator, factory.Get(), CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE, &registration),
      S_OK);
  const ScopeExit revoke([registration] { CoRevokeClassObject(registration); });
  logging::ErrorCapture errors;
  WMIWrapper wrapper(SUCCEEDED(connection.security) ? &SecurityThatReturns<S_OK>
                                                    : &SecurityThatReturns<RPC_E_TOO_LATE>);
  EXPECT_EQ(wrapper.Init(), 1);
  EXPECT_THAT(errors.Take(), ElementsAre(L"WMIWrapper::Init: " + line));
  EXPECT_EQ(FakeLocator::Live(), 0) << "the locator is kept";
  EXPECT_EQ(WbemServicesStub::Live(), 0) << "the connection is kept";

  WMIWrapper::Rows rows;
  EXPECT_EQ(wrapper.ExecuteQuery(L"Q", kNames, rows), 1);
  EXPECT_THAT(errors.Take(), ElementsAre(L"WMIWrapper::ExecuteQuery: Invalid pSvc pointer; query Q"));
  EXPECT_THAT(wmi.queries, IsEmpty());
}

TEST(WMIWrapper, InitThatFailsIsLoggedOnceAndKeepsNothing) {
  const struct {
    Connection connection;
    const wchar_t* line;
  } rows[] = {
      {{RPC_E_TOO_LATE, S_OK, S_OK}, L"Failed to initialize security. Error code = 80010119"},
      {{S_OK, REGDB_E_CLASSNOTREG, S_OK}, L"Failed to create IWbemLocator object. Err code = 80040154"},
      {{S_OK, S_OK, E_ACCESSDENIED}, L"Coult not connect to server. Error code = 80070005"},
      {{S_OK, S_OK, S_OK}, L"Could not set proxy blanket. Error code = 80004002"},
  };
  for (const auto& row : rows) {
    std::thread([&row] {
      ASSERT_EQ(CoInitializeEx(nullptr, COINIT_MULTITHREADED), S_OK);
      FakeWmi wmi;
      ExpectFailedInit(wmi, row.connection, row.line);
      CoUninitialize();
      APTTYPE type{};
      APTTYPEQUALIFIER qualifier{};
      EXPECT_EQ(CoGetApartmentType(&type, &qualifier), CO_E_NOTINITIALIZED) << "the wrapper has left COM";
    }).join();
  }
}

TEST(WMIWrapper, LiveQueriesReturnTheMachinesOwnData) {
  std::thread([] {
    logging::ErrorCapture errors;
    {
      WMIWrapper wmi;
      ASSERT_EQ(wmi.Init(), 0);
      WMIWrapper::Row system;
      EXPECT_EQ(wmi.ExecuteQuery(L"SELECT * FROM Win32_ComputerSystem", {L"Name"}, system), 0);
      wchar_t name[MAX_COMPUTERNAME_LENGTH + 1] = {};
      DWORD size = MAX_COMPUTERNAME_LENGTH + 1;
      ASSERT_TRUE(GetComputerNameW(name, &size));
      EXPECT_STRCASEEQ(system[L"Name"].asCString(), std::string(name, name + size).c_str());

      const std::wstring own = std::to_wstring(GetCurrentProcessId());
      WMIWrapper::Table processes;
      EXPECT_EQ(wmi.ExecuteQuery(L"SELECT * FROM Win32_Process WHERE ProcessId = " + own, {L"ProcessId", L"Caption"},
                                 processes),
                0);
      EXPECT_THAT(processes, ElementsAre(ElementsAre(Json::UInt(GetCurrentProcessId()), "systeminfo_test.exe")));
      EXPECT_THAT(errors.Take(), IsEmpty());

      WMIWrapper::Rows rows;
      EXPECT_EQ(wmi.ExecuteQuery(L"SELECT * FROM Win32_ComputerSystem", {L"NoSuchProperty"}, rows), 0);
      EXPECT_THAT(rows, ElementsAre(IsEmpty()));
      EXPECT_THAT(errors.Take(), ElementsAre(L"WMIWrapper::ExecuteQuery: IWbemClassObject->Get failed with message "
                                             L"WBEM_E_NOT_FOUND"));
      EXPECT_EQ(wmi.ExecuteQuery(L"this is no query", {L"Name"}, rows), 1);

      EXPECT_THAT(wmi.PropertiesOf(L"Win32_Process", {L"ProcessId", L"NoSuchProperty", L"Name"}),
                  ElementsAre(L"ProcessId", L"Name"));
      EXPECT_THAT(wmi.PropertiesOf(L"No_SuchClass", {L"Name"}), ElementsAre(L"Name"));
    }
    APTTYPE type{};
    APTTYPEQUALIFIER qualifier{};
    EXPECT_EQ(CoGetApartmentType(&type, &qualifier), CO_E_NOTINITIALIZED) << "COM is left with the wrapper";
  }).join();
}

TEST(WbemErrorName, KnownAndUnknownCodes) {
  struct {
    unsigned code;
    const wchar_t* name;
  } const rows[] = {
      {0, L"WBEM_S_NO_ERROR"},
      {0x80041001, L"WBEM_E_FAILED"},
      {0x80041002, L"WBEM_E_NOT_FOUND"},
      {0x80041006, L"WBEM_E_OUT_OF_MEMORY"},
      {0x80041008, L"WBEM_E_INVALID_PARAMETER"},
      {0x80041003, L"Invalid return code"},
      {1, L"Invalid return code"},
  };
  for (const auto& row : rows)
    EXPECT_STREQ(WbemErrorName(static_cast<HRESULT>(row.code)), row.name) << row.code;
}

}  // namespace
