// Resource ids of the registry scripts (type "REGISTRY") and the type library.
#pragma once

#define IDR_LVCONTEXTMENU 1
#define IDR_LVDATAOBJECT 2
#define IDR_LVENUMIDLIST 3
#define IDR_LVEXTRACTICON 4
#define IDR_AZQUERYINFO 5
#define IDR_LVSHELLFOLDER 6
#define IDR_LVSHELLVIEW 7
#define IDR_LVDROPTARGET 8
#define IDR_LVDROPTARGETONLISTVIEW 9

#define IDR_TYPELIB 1
