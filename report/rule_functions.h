// The functions behind the rows of the rule table (report/rules.cpp), one for each rule: each adds what it finds.
// Pure: they see the collection only, no clock and no file, and nothing in a document makes them throw.
#pragma once

#include "report/collection.h"
#include "report/finding.h"

namespace report {

// The product and its files: product_rules.cpp.
void FindMissingProduct(const Collection& collection, EvidenceList& found);
void FindUnsignedProductProcesses(const Collection& collection, EvidenceList& found);
void FindUnreadableProductFiles(const Collection& collection, EvidenceList& found);
void FindDifferingVersions(const Collection& collection, EvidenceList& found);
void FindForeignModules(const Collection& collection, EvidenceList& found);
void FindProductNotRunning(const Collection& collection, EvidenceList& found);
void FindDuplicateProduct(const Collection& collection, EvidenceList& found);
void FindOtherSecurityProducts(const Collection& collection, EvidenceList& found);
void FindCrashDumps(const Collection& collection, EvidenceList& found);

// The product's updates: update_rules.cpp.
void FindOldUpdates(const Collection& collection, EvidenceList& found);
void FindOldUpdateChecks(const Collection& collection, EvidenceList& found);
void FindChecksOlderThanUpdates(const Collection& collection, EvidenceList& found);
void FindUpdatesInTheFuture(const Collection& collection, EvidenceList& found);
void FindMissingUpdates(const Collection& collection, EvidenceList& found);

// Services, drivers, processes, and what starts with the system: service_rules.cpp, startup_rules.cpp.
void FindStoppedServices(const Collection& collection, EvidenceList& found);
void FindDisabledServices(const Collection& collection, EvidenceList& found);
void FindStoppedDrivers(const Collection& collection, EvidenceList& found);
void FindProcessesInTemporaryFolders(const Collection& collection, EvidenceList& found);
void FindManyHandles(const Collection& collection, EvidenceList& found);
void FindMisplacedSystemPrograms(const Collection& collection, EvidenceList& found);
void FindInjectedLibraries(const Collection& collection, EvidenceList& found);
void FindReplacedShell(const Collection& collection, EvidenceList& found);
void FindStartupFromTemporaryFolders(const Collection& collection, EvidenceList& found);
void FindStartupToNowhere(const Collection& collection, EvidenceList& found);

// The event logs: event_rules.cpp.
void FindProductCrashes(const Collection& collection, EvidenceList& found);
void FindServiceFailures(const Collection& collection, EvidenceList& found);
void FindErrorBursts(const Collection& collection, EvidenceList& found);
void FindStorageErrors(const Collection& collection, EvidenceList& found);
void FindSystemCrashes(const Collection& collection, EvidenceList& found);
void FindClockJumps(const Collection& collection, EvidenceList& found);

// Resources of the machine: machine_rules.cpp.
void FindLowDiskSpace(const Collection& collection, EvidenceList& found);
void FindFullSystemDrive(const Collection& collection, EvidenceList& found);
void FindExhaustedMemory(const Collection& collection, EvidenceList& found);
void FindSmallMemory(const Collection& collection, EvidenceList& found);

// The collection itself: collection_rules.cpp.
void FindMissingManifest(const Collection& collection, EvidenceList& found);
void FindFailedCollectors(const Collection& collection, EvidenceList& found);
void FindUnwrittenCollectors(const Collection& collection, EvidenceList& found);
void FindCollectorErrors(const Collection& collection, EvidenceList& found);
void FindMissingDocuments(const Collection& collection, EvidenceList& found);
void FindUnreadableDocuments(const Collection& collection, EvidenceList& found);
void FindLeftOutEntries(const Collection& collection, EvidenceList& found);

}  // namespace report
