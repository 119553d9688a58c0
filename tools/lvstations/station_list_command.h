// "lvstations list": the current user's stations with their settings, as the extension reads
// them, each text escaped so that no name can forge a line or a terminal sequence.
#pragma once

#include "tools/lvstations/station_file_commands.h"

// Prints each listed station as two lines, "NAME" and "    PORT, BAUD baud, ...", in the
// registry's order, or "No stations."; one walk over the store. Exit code 0.
int ListStationsCommand(const PrintLine& print);
