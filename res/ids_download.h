// Resource identifiers of the download progress dialogs and their texts.
#pragma once

// Dialog templates: the download dialog of both transfer paths, and its upload twin.
#define IDD_DOWNLOAD_PROGRESS 213
#define IDD_UPLOAD_PROGRESS 216

// Controls of both templates.
#define IDC_INSTRUCTIONS 214
#define IDC_STATUS_TEXT 215
#define IDC_STATION_NAME 217
#define IDC_START 218
#define IDC_STATUS_LABEL 359
#define IDC_FILE_NAME_LABEL 360

#define IDS_STATUS_LABEL 459
#define IDS_FILE_NAME_LABEL 460
#define IDS_DIGITAL_LEVELS 1001  // caption of every message box
#define IDS_FINISHING_DOWNLOAD 1012
#define IDS_WAITING_FOR_START 1013
#define IDS_TRANSFER_PERCENT 1014
#define IDS_DOWNLOADING 1031
#define IDS_START 1040
#define IDS_HALVEK_DOWNLOAD_TITLE 1041
#define IDS_UNABLE_TO_SET_FILE_PATH 1042
#define IDS_UNABLE_TO_SET_TIMEOUT 1043
#define IDS_UNABLE_TO_SET_POINTS 1044
#define IDS_UNABLE_TO_SET_COMM_PARAMS 1045
#define IDS_TERMINATING_CONNECTION 1046
#define IDS_HALVEK_NO_ERROR 1048
#define IDS_HALVEK_TEMPORARY_FILE_ERROR 1049
#define IDS_HALVEK_POINT_NAME_WRONG 1050
#define IDS_HALVEK_CANNOT_CREATE_FILE 1051
#define IDS_HALVEK_CHECKSUM_WRONG 1052
#define IDS_HALVEK_UNKNOWN_ERROR 1054
#define IDS_WAITING_FOR_DOWNLOAD 1056
#define IDS_DOWNLOAD_TITLE 1060
#define IDS_CANCEL 1080
// The download cannot even start: the temporary folder is missing, refuses files or is full.
// Arguments: the folder, the system's text.
#define IDS_TEMPORARY_FOLDER_UNUSABLE 1100
// The external library reported success but its file cannot be trusted. Argument: the system's
// text.
#define IDS_DOWNLOAD_INCOMPLETE 1101
// A second download through the external library while one runs (or has not ended yet).
#define IDS_LIBRARY_DOWNLOAD_RUNNING 1102
// The Start menu's "Kept downloads" cannot make or reach the folder. Arguments: the folder, the
// system's text.
#define IDS_KEPT_DOWNLOADS_UNAVAILABLE 1103
// The results -101 and -102 use the serial driver's texts 1070 and 1053 (res/ids_serial.h).
