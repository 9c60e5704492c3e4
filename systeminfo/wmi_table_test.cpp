#include "systeminfo/wmi_table.h"

#include <gmock/gmock.h>

#include "core/com.h"
#include "core/json.h"
#include "core/logging.h"
#include "tests/support/fake_wmi.h"

namespace systeminfo {
namespace {

using fake_wmi::Failure;
using fake_wmi::Instance;
using fake_wmi::Nothing;
using fake_wmi::Number;
using fake_wmi::Text;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr WmiColumn kColumns[] = {{L"Name"}, {L"Size", L"Gr\u00f6\u00dfe in Byte"}};
constexpr wchar_t kDropped[] = L"who: propertyNames.size() != propertyValues.size()";

class ReadTable : public testing::Test {
 protected:
  // The table as compact JSON without its line end; `expected` is what ReadWmiTable returns.
  std::string Read(Hole hole, bool expected = true, std::span<const WmiColumn> columns = kColumns) {
    Json::Value rows = "of a reading before";
    EXPECT_EQ(ReadWmiTable(m_wmi, {L"Q", columns, hole, L"who"}, rows), expected);
    std::string text = WriteCompactJson(rows);
    text.pop_back();
    return text;
  }

  FakeWmi m_fake;
  WMIWrapper m_wmi{m_fake.Services()};
  fake_wmi::Answer& m_answer = m_fake.answers[L"Q"];
  logging::ErrorCapture m_errors{logging::Level::kWarning};
};

constexpr Hole kHoles[] = {Hole::kIsNull, Hole::kDropsRow, Hole::kDropsTable};

TEST_F(ReadTable, WholeRowsComeInOrderUnderTheirMembersNames) {
  m_answer.instances = {{{L"Name", Text(L"b")}, {L"Size", Text(L"5000000000")}},
                        {{L"Name", Text(L"a \u6771")}, {L"Size", Nothing()}, {L"Unwanted", Number(1)}}};
  for (const Hole hole : kHoles) {
    EXPECT_EQ(Read(hole), R"([{"Gr\u00f6\u00dfe in Byte":"5000000000","Name":"b"},)"
                          R"({"Gr\u00f6\u00dfe in Byte":null,"Name":"a \u6771"}])");
  }
  EXPECT_THAT(m_errors.Take(), IsEmpty());
}

TEST_F(ReadTable, HoleCostsWhatTheTableSays) {
  m_answer.instances = {{{L"Name", Text(L"a")}, {L"Size", Number(1)}},
                        {{L"Name", Failure(WBEM_E_FAILED)}, {L"Size", Number(2)}},
                        {{L"Name", Text(L"c")}, {L"Size", Number(3)}},
                        {{L"Name", Text(L"d")}}};
  constexpr WmiColumn columns[] = {{L"Name"}, {L"Size"}};
  EXPECT_EQ(Read(Hole::kIsNull, true, columns),
            R"([{"Name":"a","Size":1},{"Name":null,"Size":2},{"Name":"c","Size":3},{"Name":"d","Size":null}])");
  EXPECT_EQ(m_errors.Take().size(), 2u) << "the wrapper's, one for each property";

  EXPECT_EQ(Read(Hole::kDropsRow, true, columns), R"([{"Name":"a","Size":1},{"Name":"c","Size":3}])");
  const std::wstring get = L"WMIWrapper::ExecuteQuery: IWbemClassObject->Get";
  EXPECT_THAT(m_errors.Take(), ElementsAre(get + L"(Name) failed with message WBEM_E_FAILED",
                                           get + L"(Size) failed with message WBEM_E_NOT_FOUND", kDropped, kDropped));

  EXPECT_EQ(Read(Hole::kDropsTable, true, columns), "null");
  EXPECT_EQ(m_errors.Take().size(), 3u) << "the table is given up at its first hole";
}

TEST_F(ReadTable, FailureKeepsTheRowsBeforeItAndIsLoggedOnce) {
  for (const Hole hole : kHoles) {
    m_answer = {};
    EXPECT_EQ(Read(hole), "[]") << "nothing there";
    m_answer.queryStatus = WBEM_E_ACCESS_DENIED;
    EXPECT_EQ(Read(hole, false), "[]");
    EXPECT_THAT(m_errors.Take(), ElementsAre(L"WMIWrapper::ExecuteQuery: Query Q failed. Error code 80041003"));

    m_answer.queryStatus = WBEM_S_NO_ERROR;
    for (const auto end : {WBEM_E_TRANSPORT_FAILURE, WBEM_S_TIMEDOUT}) {
      m_answer.instances = {{{L"Name", Text(L"a")}, {L"Size", Number(1)}}};
      m_answer.endStatus = static_cast<HRESULT>(end);
      EXPECT_EQ(Read(hole, false), R"([{"Gr\u00f6\u00dfe in Byte":1,"Name":"a"}])");
      EXPECT_EQ(m_errors.Take().size(), 1u);
    }
  }
}

// What providers put into a VARIANT, as it looks in a file.
TEST_F(ReadTable, ValuesOfEveryType) {
  const auto of = [](VARTYPE type, auto set) {
    return Instance{{L"Value", [=](VARIANT* value) {
                       value->vt = type;
                       set(*value);
                       return WBEM_S_NO_ERROR;
                     }}};
  };
  const auto nothing = [](VARIANT&) {};
  const auto addresses = [](VARIANT& value) {
    value.parray = SafeArrayCreateVector(VT_BSTR, 0, 2);
    LONG index = 0;
    for (const wchar_t* text : {L"10.0.0.1", L"fe80::1"}) {
      SafeArrayPutElement(value.parray, &index, MakeBstr(text).Get());
      ++index;
    }
  };
  const std::pair<Instance, const char*> rows[] = {
      {of(VT_EMPTY, nothing), "null"},
      {of(VT_NULL, nothing), "null"},
      {of(VT_I2, [](VARIANT& v) { v.iVal = -1; }), "65535"},
      {of(VT_I4, [](VARIANT& v) { v.lVal = -1; }), "4294967295"},
      {of(VT_UI1, [](VARIANT& v) { v.bVal = 9; }), "9"},
      {of(VT_BOOL, [](VARIANT& v) { v.boolVal = VARIANT_TRUE; }), "-1"},
      {of(VT_BSTR, [](VARIANT& v) { v.bstrVal = nullptr; }), "\"\""},
      {of(VT_ARRAY | VT_BSTR, addresses),
       R"(["10.0.0.1","fe80::1","fe80::1","fe80::1","fe80::1","fe80::1","fe80::1","fe80::1"])"},
      {of(VT_ARRAY | VT_BSTR, [](VARIANT& v) { v.parray = nullptr; }), "[]"},
      {of(VT_R8, [](VARIANT& v) { v.dblVal = 1.5; }), "null"},
      {of(VT_UNKNOWN, [](VARIANT& v) { v.punkVal = nullptr; }), "null"},
  };
  std::string expected;
  for (const auto& [instance, value] : rows) {
    m_answer.instances.push_back(instance);
    expected += std::string(expected.empty() ? "" : ",") + "{\"Value\":" + value + "}";
  }
  constexpr WmiColumn columns[] = {{L"Value"}};
  EXPECT_EQ(Read(Hole::kDropsTable, true, columns), "[" + expected + "]");
  EXPECT_THAT(m_errors.Take(), ElementsAre(L"VariantToJsonValue: Untreated variant type=5",
                                           L"VariantToJsonValue: Untreated variant type=13"));
}

}  // namespace
}  // namespace systeminfo
