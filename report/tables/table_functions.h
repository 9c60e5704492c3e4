// The functions behind the rows of the table list (report/tables/table_list.cpp) that need more than a list of columns.
// Each adds its table when the collection has what it shows. Pure, and nothing in a document makes them throw.
#pragma once

#include "report/tables/table.h"

namespace report {

void AddProcessTable(TableContext& context);     // a tree by the parents' ids
void AddModuleTable(TableContext& context);      // of all processes
void AddHandleTable(TableContext& context);      // how many of which type a process has
void AddEventTable(TableContext& context);       // all logs in one
void AddUpdateTimeTable(TableContext& context);  // the product's last updates
void AddRegistryTable(TableContext& context);    // a tree of keys and values
void AddPackageTable(TableContext& context);     // the package's own files
void AddOtherTables(TableContext& context);      // what no other table has taken

}  // namespace report
