// Makes the index of all hashes in the system's catalogs.
#pragma once

#include <windows.h>
// windows.h leaves it out under WIN32_LEAN_AND_MEAN; it has to come second.
#include <wincrypt.h>

#include <memory>
#include <string>

#include "systeminfo/catalog_index.h"

// The entry points of crypt32.dll that reading a catalog takes.
struct CatalogCalls {
  decltype(&CertCreateContext) createContext = nullptr;
  decltype(&CertFreeCTLContext) freeContext = nullptr;
  decltype(&CertEnumSubjectInSortedCTL) nextSubject = nullptr;
};

// Of the catalogs of this system. Null when an entry point is missing.
std::unique_ptr<CatalogHashIndex> LoadCatalogHashIndex();

// Of the "*.cat" files in those folders of `root` whose names are GUIDs in braces. A file that cannot be read, or is no
// catalog of hashes, is passed over.
std::unique_ptr<CatalogHashIndex> LoadCatalogHashIndex(const std::wstring& root, const CatalogCalls& calls);
