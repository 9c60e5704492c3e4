#include "systeminfo/network_adapters.h"

#include <gmock/gmock.h>

#include <cstring>

#include "core/logging.h"
#include "systeminfo/network_collector.h"

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr time_t kTime =
    1'700'000'000;  // 14 or 15 November 2023: a day of two digits, which all C libraries write alike

template <size_t size>
void Set(char (&field)[size], const char* text) {
  ASSERT_LE(std::strlen(text), size);
  std::memcpy(field, text, std::strlen(text));
}

std::string LocalTime(time_t time) {
  char text[64] = {};
  std::strftime(text, sizeof text, "%a %b %d %H:%M:%S %Y", std::localtime(&time));
  return text;
}

TEST(DescribeAdapter, EveryMemberComesFromItsFieldWithAndWithoutDhcp) {
  IP_ADAPTER_INFO adapter{};
  Json::Value expected;
  Set(adapter.AdapterName, "{00000004-0000-0000-0000-4E6574446576}");
  expected["name"] = "{00000004-0000-0000-0000-4E6574446576}";
  adapter.Index = 0xFFFF'FFFE;
  expected["index"] = 0xFFFF'FFFEu;
  adapter.Type = 6;
  expected["adapter_type"] = "Ethernet";
  const std::pair<IP_ADDR_STRING*, const char*> addresses[] = {
      {&adapter.IpAddressList, "ip"}, {&adapter.GatewayList, "default_gateway"}, {&adapter.DhcpServer, "dhcp_server"}};
  for (const auto& [field, member] : addresses) {
    Set(field->IpAddress.String, member);
    expected[member] = member;
  }
  Set(adapter.IpAddressList.IpMask.String, "255.255.255.0");
  expected["subnet"] = "255.255.255.0";
  adapter.LeaseObtained = kTime;
  adapter.LeaseExpires = kTime + 86'400;
  expected["lease_obtained"] = LocalTime(kTime);
  expected["lease_expires"] = LocalTime(kTime + 86'400);
  for (const UINT dhcp : {0u, 1u, 2u}) {
    adapter.DhcpEnabled = dhcp;
    expected["dhcp_enabled"] = dhcp != 0;
    EXPECT_EQ(DescribeAdapter(adapter), expected);
  }
}

TEST(DescribeAdapter, FieldsWithoutAnEndAndWithStrangeBytesAreCutAndStayText) {
  IP_ADAPTER_INFO adapter{};
  std::memset(adapter.AdapterName, 'n', sizeof adapter.AdapterName);
  std::memset(adapter.IpAddressList.IpAddress.String, 0xFF, sizeof adapter.IpAddressList.IpAddress.String);
  const Json::Value described = DescribeAdapter(adapter);
  EXPECT_EQ(described["name"], std::string(sizeof adapter.AdapterName, 'n'));
  EXPECT_THAT(described["ip"].asString(), testing::StartsWith("\uFFFD"));
  EXPECT_EQ(described["subnet"], "");
}

TEST(AdapterTypeText, KnownTypesAndTheRest) {
  const std::pair<UINT, const char*> rows[] = {
      {1, "Other"},   {6, "Ethernet"},  {9, "TokenRing"},        {15, "FDDI"},
      {23, "PPP"},    {24, "Loopback"}, {28, "Split"},           {0, "Unknown"},
      {2, "Unknown"}, {71, "Unknown"},  {0xFFFF'FFFF, "Unknown"}};
  for (const auto& [type, text] : rows)
    EXPECT_STREQ(AdapterTypeText(type), text) << type;
}

TEST(GetTimeAsValue, LowerHalfAsSignedSecondsInLocalTime) {
  logging::ErrorCapture errors;
  EXPECT_EQ(GetTimeAsValue(kTime).asString(), LocalTime(kTime));
  EXPECT_EQ(GetTimeAsValue((time_t{1} << 32) + kTime).asString(), LocalTime(kTime)) << "the upper half is dropped";
  EXPECT_EQ(GetTimeAsValue(0x7FFF'FFFF).asString(), LocalTime(0x7FFF'FFFF)) << "a lease without an end";
  EXPECT_THAT(errors.Take(), IsEmpty());
  for (const time_t time : {time_t{-1}, time_t{0x8000'0000}, time_t{0xFFFF'FFFF}}) {
    EXPECT_TRUE(GetTimeAsValue(time).isNull()) << time;
    EXPECT_THAT(errors.Take(), ElementsAre(L"systeminfo::GetTimeAsValue: Invalid format to _localtime32_s"));
  }
}

TEST(GetAdaptersInformation, FailureOfEitherCallIsLoggedAndYieldsNothing) {
  logging::ErrorCapture errors;
  const std::wstring scope = L"systeminfo::GetAdaptersInformation: GetAdaptersAddresses fails with ";
  EXPECT_EQ(GetAdaptersInformation([](IP_ADAPTER_INFO*, ULONG*) -> DWORD { return ERROR_NO_DATA; }), nullptr);
  EXPECT_THAT(errors.Take(), ElementsAre(scope + L"232 at the 1st call"));
  EXPECT_EQ(GetAdaptersInformation([](IP_ADAPTER_INFO*, ULONG*) -> DWORD { return ERROR_SUCCESS; }), nullptr);
  EXPECT_THAT(errors.Take(), ElementsAre(scope + L"0 at the 1st call"));
  EXPECT_EQ(GetAdaptersInformation([](IP_ADAPTER_INFO*, ULONG* size) -> DWORD {
              *size += 640;  // the list grew between the calls
              return ERROR_BUFFER_OVERFLOW;
            }),
            nullptr);
  EXPECT_THAT(errors.Take(), ElementsAre(scope + L"111 at the 2nd call"));
}

TEST(GetAdaptersInformation, ListIsDescribedInItsOrderWithALineForEachOfTypeOther) {
  const auto adapters = GetAdaptersInformation([](IP_ADAPTER_INFO* first, ULONG* size) -> DWORD {
    constexpr ULONG kSize = 4 * sizeof(IP_ADAPTER_INFO) + 100;  // the system's records are larger than the header's
    if (first == nullptr) {
      *size = kSize;
      return ERROR_BUFFER_OVERFLOW;
    }
    EXPECT_EQ(*size, kSize);
    std::memset(static_cast<void*>(first), 0, kSize);
    first[0].Next = &first[3];
    first[3].Next = &first[1];
    first[0].Type = first[1].Type = 1;
    first[3].Index = 7;
    return ERROR_SUCCESS;
  });
  testing::internal::CaptureStdout();
  const Json::Value described = DescribeAdapters(adapters.get());
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "Other\nOther\n");
  ASSERT_EQ(described.size(), 3u);
  EXPECT_EQ(described[0]["adapter_type"], "Other");
  EXPECT_EQ(described[1]["index"], 7u);
  EXPECT_EQ(DescribeAdapters(nullptr), Json::Value(Json::arrayValue));
}

TEST(NetworkCollector, LiveAdaptersAreThoseOfTheInterfaceTable) {
  NetworkCollector collector(L"network");
  collector.Start(nullptr, nullptr, nullptr);
  const Json::Value data = collector.GetData();
  ASSERT_TRUE(data.isArray());
  for (const Json::Value& adapter : data) {
    MIB_IFROW row{};
    row.dwIndex = adapter["index"].asUInt();
    EXPECT_EQ(GetIfEntry(&row), DWORD{NO_ERROR}) << adapter["name"].asString();
    EXPECT_EQ(adapter["adapter_type"], AdapterTypeText(row.dwType));
    EXPECT_EQ(adapter["name"].asString().size(), 38u) << "a GUID in braces";
  }
}

}  // namespace
}  // namespace systeminfo
