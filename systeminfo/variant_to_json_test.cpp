#include "systeminfo/variant_to_json.h"

#include <gmock/gmock.h>

#include <functional>
#include <vector>

#include "core/com.h"
#include "core/json.h"
#include "core/logging.h"

namespace {

using testing::ElementsAre;

struct SafeArrayTraits {
  using Type = SAFEARRAY*;
  static bool IsValid(SAFEARRAY* array) { return array != nullptr; }
  static void Close(SAFEARRAY* array) { SafeArrayDestroy(array); }
};
using ScopedSafeArray = Scoped<SafeArrayTraits>;

ScopedSafeArray StringArray(const std::vector<const wchar_t*>& texts, LONG lowerBound = 0) {
  SAFEARRAYBOUND bound{static_cast<ULONG>(texts.size()), lowerBound};
  ScopedSafeArray array(SafeArrayCreate(VT_BSTR, 1, &bound));
  for (size_t i = 0; i < texts.size(); ++i) {
    LONG index = lowerBound + static_cast<LONG>(i);
    const ScopedBstr text = texts[i] == nullptr ? ScopedBstr() : MakeBstr(texts[i]);
    SafeArrayPutElement(array.Get(), &index, text.Get());
  }
  return array;
}

std::string Converted(VARTYPE type, const std::function<void(VARIANT&)>& set) {
  VARIANT variant{};
  variant.vt = type;
  set(variant);
  std::string text = WriteCompactJson(VariantToJsonValue(variant));
  text.pop_back();  // the newline
  return text;
}

std::string Converted(const ScopedSafeArray& array) {
  return Converted(VT_ARRAY | VT_BSTR, [&](VARIANT& v) { v.parray = array.Get(); });
}

TEST(VariantToJson, EveryTreatedScalarType) {
  const auto nothing = [](VARIANT&) {};
  EXPECT_EQ(Converted(VT_EMPTY, nothing), "null");
  EXPECT_EQ(Converted(VT_NULL, nothing), "null");
  EXPECT_EQ(Converted(VT_I2, [](VARIANT& v) { v.iVal = -1; }), "65535");
  EXPECT_EQ(Converted(VT_I2, [](VARIANT& v) { v.iVal = 32767; }), "32767");
  EXPECT_EQ(Converted(VT_I4, [](VARIANT& v) { v.lVal = -1; }), "4294967295");
  EXPECT_EQ(Converted(VT_I4, [](VARIANT& v) { v.lVal = 4; }), "4");
  EXPECT_EQ(Converted(VT_BOOL, [](VARIANT& v) { v.boolVal = VARIANT_TRUE; }), "-1");
  EXPECT_EQ(Converted(VT_BOOL, [](VARIANT& v) { v.boolVal = VARIANT_FALSE; }), "0");
  EXPECT_EQ(Converted(VT_UI1, [](VARIANT& v) { v.bVal = 200; }), "200");
  EXPECT_EQ(Converted(VT_UI1, [](VARIANT& v) { v.iVal = -2; }), "-2");
  EXPECT_EQ(Converted(VT_BSTR, [](VARIANT& v) { v.bstrVal = nullptr; }), "\"\"");
  const ScopedBstr text = MakeBstr(L"C:\\\u00e4 \U0001F600");
  EXPECT_EQ(Converted(VT_BSTR, [&](VARIANT& v) { v.bstrVal = text.Get(); }), R"("C:\\\u00e4 \ud83d\ude00")");
}

TEST(VariantToJson, SignednessOfTheJsonTypeIsKept) {
  VARIANT variant{};
  variant.vt = VT_I4;
  EXPECT_EQ(VariantToJsonValue(variant).type(), Json::uintValue);
  variant.vt = VT_I2;
  EXPECT_EQ(VariantToJsonValue(variant).type(), Json::intValue);
  variant.vt = VT_BOOL;
  EXPECT_EQ(VariantToJsonValue(variant).type(), Json::intValue);
}

TEST(VariantToJson, StringArrayIsFilledUpToEightWithItsLastString) {
  EXPECT_EQ(Converted(StringArray({L"a", L"b"})), R"(["a","b","b","b","b","b","b","b"])");
  EXPECT_EQ(Converted(StringArray({L"1", L"2", L"3", L"4", L"5", L"6", L"7", L"8", L"9", L"10"})),
            R"(["1","2","3","4","5","6","7","8"])");
  EXPECT_EQ(Converted(StringArray({})), R"(["","","","","","","",""])");
  EXPECT_EQ(Converted(StringArray({L"a", nullptr, L"c"})), R"(["a","","c","c","c","c","c","c"])");
  EXPECT_EQ(Converted(StringArray({L"a"}, 2)), R"(["","","a","a","a","a","a","a"])");
  EXPECT_EQ(Converted(ScopedSafeArray()), "[]");
}

TEST(VariantToJson, OtherTypesAreNullAndLogged) {
  logging::ErrorCapture warnings(logging::Level::kWarning);
  const int types[] = {VT_R8, VT_I8, VT_UNKNOWN, VT_BYREF | VT_BSTR, VT_ARRAY | VT_I4};
  for (const int type : types) {
    EXPECT_EQ(Converted(static_cast<VARTYPE>(type), [](VARIANT&) {}), "null") << type;
  }
  EXPECT_THAT(
      warnings.Take(),
      ElementsAre(L"VariantToJsonValue: Untreated variant type=5", L"VariantToJsonValue: Untreated variant type=20",
                  L"VariantToJsonValue: Untreated variant type=13", L"VariantToJsonValue: Untreated variant type=16392",
                  L"VariantToJsonValue: Untreated variant type=8195"));

  SAFEARRAYBOUND bounds[] = {{2, 0}, {2, 0}};
  EXPECT_EQ(Converted(ScopedSafeArray(SafeArrayCreate(VT_BSTR, 2, bounds))), "null") << "two dimensions";
  EXPECT_EQ(warnings.Take().size(), 1u);
}

}  // namespace
