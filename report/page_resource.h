// Identifiers that the resource file and the sources share. Read by the resource compiler too.
#pragma once

#define IDR_REPORT_PAGE 101
