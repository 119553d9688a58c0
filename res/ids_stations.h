// Resource identifiers of the station store and the property sheet.
#pragma once

// The station property sheet's page and its controls.
#define IDD_STATION_GENERAL 201
#define IDC_STATION_NAME_EDIT 203
#define IDC_STATION_PORT 205
#define IDC_STATION_MODEL 206
#define IDC_STATION_BAUD 208
#define IDC_STATION_PARITY 209
#define IDC_STATION_NAME_LABEL 350
#define IDC_STATION_PORT_LABEL 352
#define IDC_STATION_BAUD_LABEL 354
#define IDC_STATION_PARITY_LABEL 355
#define IDC_STATION_MODEL_LABEL 361

#define IDS_NAME_LABEL 450
#define IDS_PORT_LABEL 452
#define IDS_BAUD_LABEL 454
#define IDS_PARITY_LABEL 455
#define IDS_GENERAL_TAB 461
#define IDS_MODEL_LABEL 462
#define IDS_ADD_NEW_DIGITAL_LEVEL 1000
#define IDS_CREATE_DIGITAL_LEVEL 1002
#define IDS_STATION_EXISTS 1027
#define IDS_STATION_NAME_SYMBOLS 1028
#define IDS_STATION_NAME_EMPTY 1029
#define IDS_STATION_PROPERTIES 1035

// The store refused a change. Arguments: the station's quoted name and the system's text; the
// number of stations a message leaves unnamed.
#define IDS_STATION_NOT_STORED 1130
#define IDS_MORE_STATIONS 1131
// The mark of a stored port that this computer does not list now (the port's name for %s), and
// the refusal of a value the station may not hold (the value's name, then why).
#define IDS_PORT_NOT_PRESENT 1146
#define IDS_STATION_VALUE_REFUSED 1147

#define IDS_PARITY_NONE 1015
#define IDS_PARITY_ODD 1016
#define IDS_PARITY_EVEN 1017
#define IDS_COPY_OF 1022
#define IDS_NEW_DIGITAL_LEVEL 1026
#define IDS_INSTRUCTIONS_LV10 1030
#define IDS_MODEL_LV10 1032
#define IDS_MODEL_LV20 1033
#define IDS_MODEL_LV30 1034
#define IDS_INSTRUCTIONS_LV20 1038
#define IDS_INSTRUCTIONS_LV30 1039
