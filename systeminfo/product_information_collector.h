// The collector "product_information": where the maker's product is installed, its programs and libraries with their
// versions and digests, its last updates and its scan cache. It also writes the list of the product's folders that the
// collection driver packs.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class ProductInformationCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // The data stay null when there is no product, or the settings have no "output_folder". Uses no WMI.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
