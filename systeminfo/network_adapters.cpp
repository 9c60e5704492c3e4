#include "systeminfo/network_adapters.h"

#include <cstdio>
#include <cstring>
#include <string>

#include "core/logging.h"
#include "core/text.h"

namespace systeminfo {
namespace {

struct AdapterType {
  UINT type;
  const char* text;
};

constexpr AdapterType kAdapterTypes[] = {
    {MIB_IF_TYPE_OTHER, "Other"}, {MIB_IF_TYPE_ETHERNET, "Ethernet"}, {MIB_IF_TYPE_TOKENRING, "TokenRing"},
    {MIB_IF_TYPE_FDDI, "FDDI"},   {MIB_IF_TYPE_PPP, "PPP"},           {MIB_IF_TYPE_LOOPBACK, "Loopback"},
    {MIB_IF_TYPE_SLIP, "Split"},  // kept: what reads the files knows the serial line by this text
};

// The text of a field that its zero byte ends, or its size. Always valid UTF-8.
template <size_t size>
std::string FieldText(const char (&field)[size]) {
  return ToUtf8(ToWide({field, strnlen(field, size)}));
}

}  // namespace

std::unique_ptr<IP_ADAPTER_INFO[]> GetAdaptersInformation(decltype(&GetAdaptersInfo) getAdaptersInfo) {
  // The messages name another function than the one that is called; kept.
  constexpr wchar_t kFunction[] = L"systeminfo::GetAdaptersInformation";
  ULONG size = 0;
  DWORD result = getAdaptersInfo(nullptr, &size);
  if (result != ERROR_BUFFER_OVERFLOW) {
    LOG_ERROR(kFunction, L"GetAdaptersAddresses fails with %u at the 1st call", result);
    return nullptr;
  }
  auto adapters = std::make_unique<IP_ADAPTER_INFO[]>(size / sizeof(IP_ADAPTER_INFO) + 1);
  result = getAdaptersInfo(adapters.get(), &size);
  if (result != ERROR_SUCCESS) {
    LOG_ERROR(kFunction, L"GetAdaptersAddresses fails with %u at the 2nd call", result);
    return nullptr;
  }
  return adapters;
}

const char* AdapterTypeText(UINT type) {
  for (const AdapterType& known : kAdapterTypes) {
    if (known.type == type) return known.text;
  }
  return "Unknown";
}

Json::Value DescribeAdapter(const IP_ADAPTER_INFO& adapter) {
  Json::Value object(Json::objectValue);
  object["name"] = FieldText(adapter.AdapterName);
  object["index"] = Json::UInt{adapter.Index};
  object["adapter_type"] = AdapterTypeText(adapter.Type);
  object["ip"] = FieldText(adapter.IpAddressList.IpAddress.String);
  object["subnet"] = FieldText(adapter.IpAddressList.IpMask.String);
  object["default_gateway"] = FieldText(adapter.GatewayList.IpAddress.String);
  object["dhcp_enabled"] = adapter.DhcpEnabled != 0;
  object["dhcp_server"] = FieldText(adapter.DhcpServer.IpAddress.String);
  object["lease_obtained"] = GetTimeAsValue(adapter.LeaseObtained);
  object["lease_expires"] = GetTimeAsValue(adapter.LeaseExpires);
  return object;
}

Json::Value DescribeAdapters(const IP_ADAPTER_INFO* first) {
  Json::Value adapters(Json::arrayValue);
  for (const IP_ADAPTER_INFO* adapter = first; adapter != nullptr; adapter = adapter->Next) {
    if (adapter->Type == MIB_IF_TYPE_OTHER) std::fputs("Other\n", stdout);
    adapters.append(DescribeAdapter(*adapter));
  }
  return adapters;
}

Json::Value GetTimeAsValue(time_t time) {
  constexpr wchar_t kFunction[] = L"systeminfo::GetTimeAsValue";
  const auto time32 = static_cast<__time32_t>(time);
  std::tm local{};
  if (_localtime32_s(&local, &time32) != 0) {
    LOG_ERROR(kFunction, L"Invalid format to _localtime32_s");
    return {};
  }
  char text[32] = {};
  if (asctime_s(text, sizeof text, &local) != 0) {
    LOG_ERROR(kFunction, L"Invalid arguments to asctime_s");
    return {};
  }
  return std::string(text, strcspn(text, "\n"));  // the line end says nothing
}

}  // namespace systeminfo
