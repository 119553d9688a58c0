// lvstations: the station store from the command line, as the extension sees it.
#include <windows.h>

#include <cwchar>
#include <string>
#include <vector>

#include "stations/station_store.h"
#include "support/registry_value.h"
#include "support/text_lookup.h"
#include "support/unique_resource.h"

namespace {

const wchar_t kUsage[] =
    L"Usage:\n"
    L"  lvstations list                 the stations of the current user, with their settings\n"
    L"  lvstations ports                the serial ports of this computer\n"
    L"  lvstations add NAME [options]   adds a station (fails if the name is taken)\n"
    L"      --port COMn                 serial port (default: the first port of the computer)\n"
    L"      --baud N                    baud rate (default 9600)\n"
    L"      --parity none|odd|even      parity (default even)\n"
    L"      --model TEXT                \"Quorvel LV-10\" (default), \"Quorvel LV-20\" or "
    L"\"Quorvel LV-30\"\n"
    L"  lvstations delete NAME          deletes a station\n";

// Console output as UTF-8, so that names outside the console's code page survive a pipe.
void Print(const std::wstring& text) {
    const int bytes = ::WideCharToMultiByte(CP_UTF8, 0, text.c_str(), static_cast<int>(text.size()),
                                            nullptr, 0, nullptr, nullptr);
    std::string utf8(bytes, '\0');
    ::WideCharToMultiByte(CP_UTF8, 0, text.c_str(), static_cast<int>(text.size()), utf8.data(),
                          bytes, nullptr, nullptr);
    fwrite(utf8.data(), 1, utf8.size(), stdout);
}

std::wstring ParityName(DWORD parity) {
    return LoadUiText(parity == 0   ? IDS_PARITY_NONE
                      : parity == 1 ? IDS_PARITY_ODD
                                    : IDS_PARITY_EVEN);
}

// Station names in the registry's own order, as the folder lists them.
std::vector<std::wstring> StationNames() {
    std::vector<std::wstring> names;
    UniqueRegKey stations;
    if (::RegOpenKeyExW(HKEY_CURRENT_USER, StationsKeyPath().c_str(), 0, KEY_READ,
                        stations.put()) != ERROR_SUCCESS) {
        return names;
    }
    for (DWORD index = 0;; ++index) {
        wchar_t subkey[260];
        DWORD length = ARRAYSIZE(subkey);
        if (::RegEnumKeyExW(stations.get(), index, subkey, &length, nullptr, nullptr, nullptr,
                            nullptr) != ERROR_SUCCESS) {
            break;
        }
        UniqueRegKey key;
        std::wstring name;
        if (::RegOpenKeyExW(stations.get(), subkey, 0, KEY_READ, key.put()) == ERROR_SUCCESS &&
            ReadStringValue(key.get(), L"Name", 520, name) == ERROR_SUCCESS) {
            names.push_back(name);
        }
    }
    return names;
}

int List() {
    const std::vector<std::wstring> names = StationNames();
    if (names.empty())
        Print(L"No stations.\n");
    for (const std::wstring& name : names) {
        Station station;
        station.Name = name;
        if (FindStation(station) != S_OK)
            continue;
        wchar_t line[512];
        swprintf(line, ARRAYSIZE(line), L"%ls\n    %ls, %lu baud, %lu data bits, parity %ls, %ls\n",
                 station.Name.c_str(), station.Port.c_str(), station.BaudRate, station.DataBits,
                 ParityName(station.Parity).c_str(), station.Model.c_str());
        Print(line);
    }
    return 0;
}

int Ports() {
    std::vector<std::wstring> ports;
    if (EnumerateSerialPorts(ports) == 0)
        Print(L"No serial ports.\n");
    for (const std::wstring& port : ports)
        Print(port + L"\n");
    return 0;
}

int Add(int argc, wchar_t** argv) {
    Station station = DefaultStation();
    station.Name = argv[2];
    std::vector<std::wstring> ports;
    if (EnumerateSerialPorts(ports) > 0)
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
            Print(L"Unknown option " + option + L"\n" + kUsage);
            return 2;
        }
    }
    const HRESULT result = AddStation(station);
    if (result == E_INVALIDARG) {
        Print(L"A station named \"" + station.Name + L"\" already exists.\n");
        return 1;
    }
    if (result != S_OK) {
        Print(L"The station could not be stored.\n");
        return 1;
    }
    Print(L"Added \"" + station.Name + L"\".\n");
    return 0;
}

int Delete(const wchar_t* name) {
    Station station;
    station.Name = name;
    if (DeleteStation(station) != S_OK) {
        Print(L"No station named \"" + station.Name + L"\".\n");
        return 1;
    }
    Print(L"Deleted \"" + station.Name + L"\".\n");
    return 0;
}

}  // namespace

int wmain(int argc, wchar_t** argv) {
    const std::wstring command = argc > 1 ? argv[1] : L"";
    if (command == L"list" && argc == 2)
        return List();
    if (command == L"ports" && argc == 2)
        return Ports();
    if (command == L"add" && argc >= 3)
        return Add(argc, argv);
    if (command == L"delete" && argc == 3)
        return Delete(argv[2]);
    Print(kUsage);
    return command == L"--help" || command == L"-h" ? 0 : 2;
}
