// All tables of a report: one list, in the order in which they are shown.
#pragma once

#include <vector>

#include "report/tables/table.h"

namespace report {

// Of what is in the collection only; what no table of the list shows is flattened into tables of places and values.
std::vector<Table> MakeTables(const Collection& collection);

}  // namespace report
