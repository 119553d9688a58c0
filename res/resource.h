// Resource identifiers shared by the resource scripts and the code, one header per area.
#pragma once

#include "res/ids_stations.h"
#include "res/ids_namespace.h"
#include "res/ids_serial.h"
#include "res/ids_download.h"
#include "res/ids_view.h"
