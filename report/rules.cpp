#include "report/rules.h"

#include <algorithm>

#include "report/rule_functions.h"

namespace report {
namespace {

constexpr Severity kError = Severity::kError, kWarning = Severity::kWarning, kInfo = Severity::kInfo;

// The only list. A row belongs to the function that its last member names.
constexpr Rule kRules[] = {
    // The product and its files.
    {"product-not-installed", kWarning, "The product is not installed",
     "The collector found no entry of the product in the list of installed programs. Ask whether it was removed, or "
     "install it again.",
     &FindMissingProduct},
    {"product-process-unsigned", kError, "A program of the product is running without a valid signature",
     "Every program that ships is signed. The file was replaced or damaged: compare its MD5 with the release.",
     &FindUnsignedProductProcesses},
    {"product-file-unreadable", kWarning, "A file of the product could not be read",
     "Its digest is empty: the file is locked, damaged or not accessible. Check the disk and the folder's rights.",
     &FindUnreadableProductFiles},
    {"product-version-mismatch", kWarning, "A file of the product has another version than its siblings",
     "An update may have been applied in part. Let the customer repair the installation, then collect again.",
     &FindDifferingVersions},
    {"product-foreign-module", kWarning, "A library from elsewhere is loaded into the product",
     "It lies neither in the product's folder nor in that of Windows. Other protection software and hooking tools do "
     "so; try without it.",
     &FindForeignModules},
    {"product-not-running", kError, "The product is installed, but none of its programs is running",
     "Look for stopped services, for crashes in the event log, and for a program that ends it.",
     &FindProductNotRunning},
    {"product-duplicate", kWarning, "The product is installed more than once",
     "Two installations share services and settings. Let the customer remove all of them and install one.",
     &FindDuplicateProduct},
    {"other-security-product", kWarning, "Another security product is installed",
     "Two products that watch the same files slow each other down or block each other. Only one should be active.",
     &FindOtherSecurityProducts},
    {"product-crash-dumps", kWarning, "The product left crash dumps",
     "Open them with a debugger; their times say whether they belong to this case.", &FindCrashDumps},

    // Its updates.
    {"update-old", kError, "No update for seven days", "Check the connection, the proxy and the licence.",
     &FindOldUpdates},
    {"update-check-old", kError, "No look for updates for seven days",
     "The updater does not run: check its service, its scheduled task and the computer's time.", &FindOldUpdateChecks},
    {"update-check-before-update", kWarning, "The last check for updates is older than the last update",
     "An update follows a check. The clock was changed, or the statistics were copied from elsewhere.",
     &FindChecksOlderThanUpdates},
    {"update-in-future", kWarning, "An update is later than the collection",
     "The computer's clock was wrong then or is wrong now; signatures and certificates depend on it.",
     &FindUpdatesInTheFuture},
    {"update-unknown", kWarning, "Nothing is known of the product's updates",
     "update_statistics.xml is missing or incomplete: the product was never updated, or its folder is damaged.",
     &FindMissingUpdates},

    // Services, drivers, processes.
    {"service-stopped", kError, "A service of the product is not running",
     "It starts by itself, so that it failed or was ended. The System log says why.", &FindStoppedServices},
    {"service-disabled", kError, "A service of the product is disabled",
     "Somebody switched it off. Set it to start by itself again.", &FindDisabledServices},
    {"driver-stopped", kError, "A driver of the product is not running",
     "Without it files are not watched. Look for a pending restart and for a blocked or unsigned driver.",
     &FindStoppedDrivers},
    {"process-in-temporary-folder", kWarning, "A program runs from a temporary folder",
     "Installers do so for a while, malicious programs do so for long. Have the file examined.",
     &FindProcessesInTemporaryFolders},
    {"process-many-handles", kWarning, "A process holds very many handles",
     "It probably leaks them, which slows the system and ends in failures. Collect again later and compare.",
     &FindManyHandles},
    {"process-misplaced", kError, "A program with a system program's name runs from elsewhere",
     "It pretends to be a part of Windows. Treat the computer as infected until the file was examined.",
     &FindMisplacedSystemPrograms},

    // What starts with the system.
    {"startup-injected-library", kWarning, "A library or program is loaded into other programs",
     "AppInit_DLLs, AppCertDlls, Load, Run and AutoRun are rarely used for good. Find out what set the value.",
     &FindInjectedLibraries},
    {"startup-shell-replaced", kError, "Windows starts with another shell or logon program",
     "Outside of kiosks only malicious programs replace them.", &FindReplacedShell},
    {"startup-from-temporary-folder", kWarning, "A program in a temporary folder starts with the system",
     "No installer leaves such an entry for good. Have the file examined.", &FindStartupFromTemporaryFolders},
    {"startup-to-nowhere", kWarning, "A startup entry points nowhere",
     "It is empty, or names a program that the product's folder does not hold: a leftover of a removal or an update "
     "that failed.",
     &FindStartupToNowhere},

    // The event logs.
    {"product-crash", kError, "A program of the product crashed or hung",
     "The event names the module and the address; ask for the dump if it is not in the package.", &FindProductCrashes},
    {"service-failure", kError, "Windows reports the failure of a service of the product",
     "The event's texts hold the service and the error number.", &FindServiceFailures},
    {"event-error-burst", kWarning, "Many errors in the last hour of an event log",
     "At least twenty within an hour of the newest record. Look at the first of them: the others often follow from it.",
     &FindErrorBursts},
    {"storage-errors", kError, "Windows reports errors of a disk or file system",
     "Let the customer save his data and check the disk before anything else.", &FindStorageErrors},
    {"system-crash", kWarning, "Windows crashed or was switched off without shutting down",
     "Compare the time with the complaint; files that were being written then may be damaged.", &FindSystemCrashes},
    {"clock-jump", kWarning, "The computer's clock was changed",
     "Records are out of order or later than the collection. Times in all logs are to be read with care.",
     &FindClockJumps},

    // The machine.
    {"disk-space-low", kWarning, "Less than ten per cent of a drive is free",
     "Updates, quarantine and dumps need room. Let the customer tidy up.", &FindLowDiskSpace},
    {"system-drive-full", kError, "Less than 1 GiB is free on the drive of Windows",
     "Updates fail and programs crash in strange ways. Nothing else is worth looking at before.", &FindFullSystemDrive},
    {"memory-exhausted", kWarning, "Less than five per cent of the memory is available",
     "Everything is slow then. Look for the process that takes it.", &FindExhaustedMemory},
    {"memory-small", kInfo, "The computer has less than 2 GiB of memory", "Scans are slow on such a computer.",
     &FindSmallMemory},

    // The collection itself.
    {"manifest-missing", kWarning, "The collection has no manifest",
     "The run was ended early, or the package was put together by hand. What is missing cannot be told.",
     &FindMissingManifest},
    {"collector-failed", kWarning, "A collector failed", "Its file is missing or incomplete.", &FindFailedCollectors},
    {"collector-not-written", kWarning, "The file of a collector could not be written",
     "The disk was full, or another program held the file.", &FindUnwrittenCollectors},
    {"collector-errors", kInfo, "Collectors logged errors", "Some facts may be missing from their files.",
     &FindCollectorErrors},
    {"document-missing", kWarning, "A collected file is not in the package",
     "It did not fit the package's limit, or was removed.", &FindMissingDocuments},
    {"document-unreadable", kError, "A file of the collection cannot be read",
     "The package is damaged or was changed: no collector writes such a file. Ask for a new one.",
     &FindUnreadableDocuments},
    {"entry-left-out", kWarning, "An entry of the archive was left out, as it is not safe",
     "The support tool writes no such names, links or duplicates: treat a package with them as hostile. Of a file that "
     "is only too large, ask for the file itself.",
     &FindLeftOutEntries},
};

}  // namespace

std::span<const Rule> RuleTable() {
  return kRules;
}

std::vector<Finding> FindAll(const Collection& collection) {
  std::vector<Finding> findings;
  for (const Rule& rule : kRules) {
    Finding finding{&rule, {}};
    rule.find(collection, finding.evidence);
    if (finding.evidence.Count() > 0) findings.push_back(std::move(finding));
  }
  std::stable_sort(findings.begin(), findings.end(),
                   [](const Finding& a, const Finding& b) { return a.rule->severity > b.rule->severity; });
  return findings;
}

const char* SeverityName(Severity severity) {
  switch (severity) {
    case Severity::kInfo:
      return "info";
    case Severity::kWarning:
      return "warning";
    case Severity::kError:
      return "error";
  }
  return "";
}

}  // namespace report
