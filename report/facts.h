// What several rules ask of a collection. Pure functions that survive any document.
#pragma once

#include <string>
#include <string_view>

#include "report/collection.h"
#include "report/json_access.h"

namespace report {

inline constexpr char kPublisher[] = "Quorvex";  // as the product's entry in the list of installed software has it

std::string InstallLocation(const Collection& collection);  // empty when the product is not installed

// By its path: some file of the product, wherever in the installation.
bool IsProductFile(const Collection& collection, std::string_view path);

// `visit` (process, "processes[index]"), `visit` (file record, "file_information[index]").
template <class Visit>
void ForEachProcess(const Collection& collection, Visit visit) {
  ForEachElement(Member(collection.Document("running_tasks"), "processes"),
                 [&](const Json::Value& process, const std::string& path) { visit(process, "processes" + path); });
}
template <class Visit>
void ForEachProductFile(const Collection& collection, Visit visit) {
  ForEachElement(Member(collection.Document("product_information"), "file_information"),
                 [&](const Json::Value& file, const std::string& path) { visit(file, "file_information" + path); });
}

}  // namespace report
