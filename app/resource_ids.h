// Identifiers of the program's resources; read by the resource compiler too.
#pragma once

#define ST_ICON 102
