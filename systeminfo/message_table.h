// Checks a message table (the resource RT_MESSAGETABLE of a message library) before the system looks texts up in it:
// the system's own look-up follows the table's offsets and lengths without asking where they lead. Includes no Windows
// header.
#pragma once

#include <string_view>

namespace systeminfo {

// True when every entry that the table announces lies in it and every text ends in it.
bool IsSoundMessageTable(std::string_view table);

}  // namespace systeminfo
