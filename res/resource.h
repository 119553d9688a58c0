// Resource identifiers shared by the resource scripts and the code, one header per area.
#pragma once

#include "res/ids_stations.h"
#if __has_include("res/ids_namespace.h")
#include "res/ids_namespace.h"
#endif
#if __has_include("res/ids_serial.h")
#include "res/ids_serial.h"
#endif
#if __has_include("res/ids_download.h")
#include "res/ids_download.h"
#endif
#if __has_include("res/ids_view.h")
#include "res/ids_view.h"
#endif
