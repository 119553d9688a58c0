// Resource identifiers of the namespace folder and the COM server.
#pragma once

#define IDI_MODULE 100   // the folder's icon under My Computer (DefaultIcon "%MODULE%,0")
#define IDI_STATION 101  // a station: a digital level on a tripod
#define IDI_ROOT 102     // the root folder and any item of unknown kind
#define IDI_FILE 104     // the received data file
