#include "report/facts.h"

#include "report/windows_text.h"

namespace report {

std::string InstallLocation(const Collection& collection) {
  return TextOf(Member(collection.Document("product_information"), "install_location"));
}

bool IsProductFile(const Collection& collection, std::string_view path) {
  return LiesBelow(InstallLocation(collection), path);
}

}  // namespace report
