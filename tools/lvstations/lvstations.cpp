// lvstations: the station store from the command line, as the extension sees it, and station
// files to provision many computers alike.
#include <windows.h>
#include <commctrl.h>

#include <cwchar>
#include <optional>
#include <string>
#include <vector>

#include "res/resource.h"
#include "stations/portable/station_fields.h"
#include "stations/portable/station_names.h"
#include "stations/serial_ports.h"
#include "stations/station_dialog.h"
#include "stations/station_store.h"
#include "support/module_instance.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"
#include "tools/common/console_output.h"
#include "tools/lvstations/portable/printable_text.h"
#include "tools/lvstations/station_file_commands.h"
#include "tools/lvstations/station_list_command.h"

namespace {

const wchar_t kUsage[] =
    L"Usage:\n"
    L"  lvstations list                 the stations of the current user, with their settings;\n"
    L"                                  characters a terminal would act on are printed as\n"
    L"                                  escapes: \\x0D, \\x1B (controls), \\u202E (line and\n"
    L"                                  direction marks, lone surrogates), \\\\ (a backslash)\n"
    L"  lvstations ports                the serial ports of this computer\n"
    L"  lvstations add NAME [options]   adds a station (fails if the name is taken)\n"
    L"      --port COMn                 serial port (default: the first port of the computer)\n"
    L"      --baud N                    baud rate (default 9600): 300, 600, 1200, 2400, 4800,\n"
    L"                                  9600, 14400, 19200, 38400, 57600 or 115200\n"
    L"      --parity none|odd|even      parity (default even)\n"
    L"      --model TEXT                \"Quorvel LV-10\" (default), \"Quorvel LV-20\" or "
    L"\"Quorvel LV-30\"\n"
    L"  lvstations add                  opens the station sheet on a new station, as the folder's\n"
    L"                                  Add command does (exit code 0 OK, 1 Cancel)\n"
    L"  lvstations properties NAME      opens the station sheet on a stored station (exit code 0\n"
    L"                                  OK, 1 Cancel, 2 no such station)\n"
    L"  lvstations delete NAME          deletes a station\n"
    L"  lvstations export FILE          writes every station to FILE, a UTF-8 text file: one\n"
    L"                                  [station name] section each, then Key = value lines\n"
    L"                                  named as in the registry (Port, BaudRate, ...)\n"
    L"  lvstations import FILE [--replace]\n"
    L"                                  adds the file's stations once the whole file is checked;\n"
    L"                                  a name already taken is skipped, or overwritten with\n"
    L"                                  --replace. A port this computer does not list is kept,\n"
    L"                                  with a warning.\n"
    L"      exit codes: 0 done; 1 import: names skipped, export: no stations or a value that\n"
    L"      cannot come back as stored; 2 usage; 3 a bad file, nothing imported; 4 a file or\n"
    L"      the store could not be read or written\n";

int Ports() {
    const std::vector<std::wstring> ports = ListSerialPorts();
    if (ports.empty())
        PrintUtf8(L"No serial ports.\n");
    for (const std::wstring& port : ports)
        PrintUtf8(PrintableText(port) + L"\n");
    return 0;
}

int Add(int argc, wchar_t** argv) {
    Station station = DefaultStation();
    station.Name = argv[2];
    const std::vector<std::wstring> ports = ListSerialPorts();
    if (!ports.empty())
        station.Port = ports.front();
    for (int i = 3; i + 1 < argc; i += 2) {
        const std::wstring option = argv[i];
        const std::wstring value = argv[i + 1];
        if (option == L"--port") {
            station.Port = value;
        } else if (option == L"--baud") {
            station.BaudRate = wcstoul(value.c_str(), nullptr, 10);
        } else if (option == L"--parity") {
            station.Parity = value == L"none" ? 0 : value == L"odd" ? 1 : 2;
        } else if (option == L"--model") {
            station.Model = value;
        } else {
            PrintUtf8(L"Unknown option " + option + L"\n" + kUsage);
            return 2;
        }
    }
    if (CheckStationName(station.Name) != StationNameProblem::kNone) {
        PrintUtf8(L"A station name must not be empty, be longer than " +
                  std::to_wstring(kMaximumStationNameLength) +
                  L" characters or contain \\ / \" or *.\n");
        return 1;
    }
    // The rule of the sheet and of station files: what is added here exports and imports back.
    const std::vector<std::wstring> models = {LoadUiText(IDS_MODEL_LV10),
                                              LoadUiText(IDS_MODEL_LV20),
                                              LoadUiText(IDS_MODEL_LV30)};
    if (const std::optional<StationFieldRefusal> refusal = RefusedStation(station, models)) {
        PrintUtf8(L"The station cannot be added: " +
                  std::wstring(StationFieldOf(refusal->field).valueName) + L": " +
                  refusal->reason.Text() + L".\n");
        return 1;
    }
    const HRESULT result = AddStation(station);
    if (result == E_INVALIDARG) {
        PrintUtf8(L"A station named \"" + station.Name + L"\" already exists.\n");
        return 1;
    }
    if (FAILED(result)) {
        PrintUtf8(L"The station could not be stored: " + SystemResultText(result) + L"\n");
        return 1;
    }
    PrintUtf8(L"Added \"" + station.Name + L"\".\n");
    return 0;
}

// The station property sheet, as the folder's Add and Properties commands open it.
int RunSheet(Station& station, bool newStation) {
    INITCOMMONCONTROLSEX controls{sizeof controls, ICC_STANDARD_CLASSES | ICC_TAB_CLASSES};
    (void)::InitCommonControlsEx(&controls);  // already registered where it fails
    CStationDialog sheet(nullptr, station, newStation);
    const INT_PTR result = sheet.DoModal();
    if (result == -1) {
        PrintUtf8(L"The station's properties could not be shown.\n");
        return 2;
    }
    return result == IDOK ? 0 : 1;
}

int AddWithSheet() {
    Station station = DefaultStation();
    station.Name = MakeUniqueStationName(LoadUiText(IDS_NEW_DIGITAL_LEVEL));
    const std::vector<std::wstring> ports = ListSerialPorts();
    if (!ports.empty())
        station.Port = ports.front();
    return RunSheet(station, true);
}

int Properties(const wchar_t* name) {
    Station station;
    station.Name = name;
    if (FindStation(station) != S_OK) {
        PrintUtf8(L"No station named \"" + station.Name + L"\".\n");
        return 2;
    }
    return RunSheet(station, false);
}

int Delete(const wchar_t* name) {
    Station station;
    station.Name = name;
    const HRESULT result = DeleteStation(station);
    if (result == E_INVALIDARG) {
        PrintUtf8(L"No station named \"" + station.Name + L"\".\n");
        return 1;
    }
    if (FAILED(result)) {
        PrintUtf8(L"\"" + station.Name + L"\" could not be deleted: " + SystemResultText(result) +
                  L"\n");
        return 1;
    }
    PrintUtf8(L"Deleted \"" + station.Name + L"\".\n");
    return 0;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    const std::wstring command = argc > 1 ? argv[1] : L"";
    const auto printLine = [](const std::wstring& line) { PrintUtf8(line + L"\n"); };
    if (command == L"list" && argc == 2)
        return ListStationsCommand(printLine);
    if (command == L"ports" && argc == 2)
        return Ports();
    if (command == L"add" && argc == 2)
        return AddWithSheet();
    if (command == L"add" && argc >= 3)
        return Add(argc, argv);
    if (command == L"properties" && argc == 3)
        return Properties(argv[2]);
    if (command == L"delete" && argc == 3)
        return Delete(argv[2]);
    if (command == L"export" && argc == 3)
        return ExportStations(argv[2], printLine);
    const bool replace = argc == 4 && std::wstring(argv[3]) == L"--replace";
    if (command == L"import" && (argc == 3 || replace))
        return ImportStations(argv[2], replace, printLine);
    PrintUtf8(kUsage);
    return command == L"--help" || command == L"-h" ? kExitDone : kExitUsage;
}
