// Resource identifiers of the serial driver's messages.
#pragma once

// Also shown by the progress dialogs for the external library's results -101 and -102: these two
// entries are defined once, here.
#define IDS_SERIAL_INTERRUPTED_BY_USER 1053
#define IDS_SERIAL_WAIT_EXPIRED 1070

#define IDS_SERIAL_PORT_NOT_OPENED 1061
#define IDS_SERIAL_BLOCK_IMPORT_FAILED 1062
#define IDS_SERIAL_INPUT_FILE_BCC_MISMATCH 1063
#define IDS_SERIAL_YMODEM_FILE_INFO 1064
#define IDS_SERIAL_SIZE_LIMIT_REACHED 1065
#define IDS_SERIAL_PORT_NOT_PRESENT 1066
#define IDS_SERIAL_PORT_NOT_PRESENT_NONE 1067
