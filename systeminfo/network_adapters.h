// The network adapters of the machine with their IPv4 configuration, as the IP helper library lists them, and what they
// look like in JSON.
#pragma once

#include <windows.h>
#include <winsock2.h>

#include <iphlpapi.h>
#include <json/value.h>

#include <ctime>
#include <memory>

namespace systeminfo {

// The first adapter; the others follow by `Next` inside the same buffer. Null, with a logged error, when the system
// gives no list, which is also its answer when there is no adapter. Tests hand in a function of their own.
std::unique_ptr<IP_ADAPTER_INFO[]> GetAdaptersInformation(
    decltype(&GetAdaptersInfo) getAdaptersInfo = &GetAdaptersInfo);

// "Ethernet" for an interface type of 6, and so on; "Unknown" for one that is not known.
const char* AdapterTypeText(UINT type);

Json::Value DescribeAdapter(const IP_ADAPTER_INFO& adapter);

// One object for each adapter of the list, which may be null. Prints the line "Other" to the standard output for each
// adapter of that type.
Json::Value DescribeAdapters(const IP_ADAPTER_INFO* first);

// A lease time as local time, "Tue Nov 14 22:13:20 2023". Only its lower 32 bits count, as a signed number; null, with
// a logged error, when they are no time (before 1970).
Json::Value GetTimeAsValue(time_t time);

}  // namespace systeminfo
