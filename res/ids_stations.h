// Resource identifiers of the station store and the property sheet.
#pragma once

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
