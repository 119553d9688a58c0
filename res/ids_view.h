// Resource identifiers of the folder view: its animation, accelerators, menu texts and commands.
#pragma once

#define IDR_SEARCH_ANIMATION 103  // plays while the view fills its list
#define IDR_VIEW_ACCELERATORS 300

// The view's list control and the animation over it.
#define IDC_VIEW_LIST 2000
#define IDC_VIEW_ANIMATION 1300

#define IDS_DELETE 1003
#define IDS_PROPERTIES 1004
#define IDS_LARGE_ICONS 1005
#define IDS_SMALL_ICONS 1006
#define IDS_LIST 1007
#define IDS_DETAILS 1008
#define IDS_NAME_COLUMN 1009
#define IDS_COPY 1010
#define IDS_PASTE 1011
#define IDS_SELECT 1036
#define IDS_OPEN 1037

// A paste refused whole (nothing stored). Arguments: the most digital levels and kilobytes a
// paste may bring in; the position and name of the refused one; its name; the names the store
// refused and the system's text.
#define IDS_PASTE_TOO_MANY 1120
#define IDS_PASTE_UNREADABLE 1121
#define IDS_PASTE_COPY_TOO_LONG 1122
#define IDS_PASTE_FAILED 1123
// Stations a delete left in place. Arguments: their names, the system's text.
#define IDS_DELETE_FAILED 1132

// The view's commands: menus, accelerators and IOleCommandTarget::Exec all reach one dispatcher.
#define IDM_REFRESH 22
#define IDM_CREATE_STATION 1280
#define IDM_COPY 1281
#define IDM_PASTE 1282
#define IDM_LARGE_ICONS 1283
#define IDM_SMALL_ICONS 1284
#define IDM_LIST 1285
#define IDM_DETAILS 1286
#define IDM_PROPERTIES 1287
#define IDM_DELETE 1288
#define IDM_OPEN 1289
