// The station property sheet: lists (ports read anew on opening), exchange, checks and the store.
#include "stations/station_dialog.h"

#include <algorithm>
#include <cwchar>
#include <vector>

#include "res/resource.h"
#include "stations/portable/station_fields.h"
#include "stations/portable/station_names.h"
#include "stations/serial_ports.h"
#include "stations/station_store.h"
#include "stations/store_failure_text.h"
#include "support/portable/text_format.h"
#include "support/text_lookup.h"
#include "support/user_interface.h"

namespace {

// The sheet's rates, with the station's own when the station rule allows it and the list lacks
// it, in ascending order.
std::vector<std::wstring> BaudRateEntries(uint32_t own) {
    std::vector<uint32_t> rates(SheetBaudRates().begin(), SheetBaudRates().end());
    if (!RefusedNumber(StationField::kBaudRate, own) &&
        std::find(rates.begin(), rates.end(), own) == rates.end()) {
        rates.insert(std::upper_bound(rates.begin(), rates.end(), own), own);
    }
    std::vector<std::wstring> entries;
    for (uint32_t rate : rates)
        entries.push_back(std::to_wstring(rate));
    return entries;
}

// A refusal's reason in the user interface's language: its format is the translation's key.
std::wstring ReasonText(const RefusalReason& reason) {
    return RefusalReason{TranslateUiText(reason.format), reason.arguments}.Text();
}

std::vector<WideString> ModelTexts() {
    return {LoadUiText(IDS_MODEL_LV10), LoadUiText(IDS_MODEL_LV20), LoadUiText(IDS_MODEL_LV30)};
}

std::wstring ParityText(uint32_t parity) {
    return LoadUiText(parity == 1 ? IDS_PARITY_ODD : parity == 2 ? IDS_PARITY_EVEN : IDS_PARITY_NONE);
}

// The decimal number at the start of the text; 0 for no selection or a text that is not one.
uint32_t BaudRateFromText(const std::wstring& text) {
    wchar_t* end = nullptr;
    const unsigned long value = std::wcstoul(text.c_str(), &end, 10);
    return end == text.c_str() ? 0 : static_cast<uint32_t>(value);
}

}  // namespace

CStationGeneralPage::CStationGeneralPage(Station& station, bool newStation)
    : CPropertyPage(IDD_STATION_GENERAL), station_(station), newStation_(newStation) {
    BindEdit(IDC_STATION_NAME_EDIT, name_);
    BindList(IDC_STATION_PORT, port_);
    BindList(IDC_STATION_BAUD, baudRate_);
    BindList(IDC_STATION_PARITY, parity_);
    BindList(IDC_STATION_MODEL, model_);
}

void CStationGeneralPage::OnInitDialog() {
    // The port and model lists sort themselves (COM10 before COM2); baud and parity keep this
    // order.
    storedPort_ = station_.Port;
    FillPortList();
    for (const std::wstring& rate : BaudRateEntries(station_.BaudRate))
        AddListEntry(IDC_STATION_BAUD, rate);
    for (UINT id : {IDS_PARITY_NONE, IDS_PARITY_ODD, IDS_PARITY_EVEN})
        AddListEntry(IDC_STATION_PARITY, LoadUiText(id));
    for (UINT id : {IDS_MODEL_LV10, IDS_MODEL_LV20, IDS_MODEL_LV30})
        AddListEntry(IDC_STATION_MODEL, LoadUiText(id));

    name_ = station_.Name;
    port_ = AbsentPortText().empty() ? station_.Port : AbsentPortText();
    baudRate_ = std::to_wstring(station_.BaudRate);
    parity_ = ParityText(station_.Parity);
    model_ = station_.Model;

    // Set here, not in the template, so that a translation relabels the page.
    SetControlText(IDC_STATION_NAME_LABEL, LoadUiText(IDS_NAME_LABEL));
    SetControlText(IDC_STATION_PORT_LABEL, LoadUiText(IDS_PORT_LABEL));
    SetControlText(IDC_STATION_BAUD_LABEL, LoadUiText(IDS_BAUD_LABEL));
    SetControlText(IDC_STATION_PARITY_LABEL, LoadUiText(IDS_PARITY_LABEL));
    SetControlText(IDC_STATION_MODEL_LABEL, LoadUiText(IDS_MODEL_LABEL));
    UpdateControls();
}

std::wstring CStationGeneralPage::AbsentPortText() const {
    if (storedPort_.empty())
        return {};
    const std::vector<std::wstring> ports = ListSerialPorts();
    if (std::find(ports.begin(), ports.end(), storedPort_) != ports.end())
        return {};
    return FormatText(LoadUiText(IDS_PORT_NOT_PRESENT), {storedPort_});
}

void CStationGeneralPage::FillPortList() {
    std::vector<std::wstring> entries = ListSerialPorts();
    const bool absent = !storedPort_.empty() &&
                        std::find(entries.begin(), entries.end(), storedPort_) == entries.end();
    const std::wstring marked = FormatText(LoadUiText(IDS_PORT_NOT_PRESENT), {storedPort_});
    if (absent)
        entries.push_back(marked);
    // Kept by its meaning: the stored port, plugged in meanwhile, loses its mark.
    UpdateFields();
    std::wstring selected = port_;
    if (selected == marked && !absent)
        selected = storedPort_;
    else if (selected == storedPort_ && absent)
        selected = marked;
    SetListEntries(IDC_STATION_PORT, entries, selected);
}

void CStationGeneralPage::OnCommand(WORD controlId, WORD notification) {
    // The port list is read anew each time it opens: an adapter plugged in meanwhile appears.
    if (controlId == IDC_STATION_PORT && notification == CBN_DROPDOWN) {
        FillPortList();
        return;
    }
    // Only an existing station has changes to apply before OK: a new one is stored by OK alone.
    if (newStation_)
        return;
    const bool nameEdited = controlId == IDC_STATION_NAME_EDIT && notification == EN_CHANGE;
    const bool listChanged =
        notification == CBN_SELCHANGE &&
        (controlId == IDC_STATION_PORT || controlId == IDC_STATION_BAUD ||
         controlId == IDC_STATION_PARITY || controlId == IDC_STATION_MODEL);
    if (nameEdited || listChanged)
        SetModified();
}

void CStationGeneralPage::ExchangeIntoRecord() {
    UpdateFields();
    station_.Name = name_;
    // The mark is display only: the record keeps the port's own name.
    const std::wstring marked = FormatText(LoadUiText(IDS_PORT_NOT_PRESENT), {storedPort_});
    station_.Port = !storedPort_.empty() && port_ == marked ? storedPort_ : port_;
    station_.BaudRate = BaudRateFromText(baudRate_);
    if (parity_ == LoadUiText(IDS_PARITY_NONE))
        station_.Parity = 0;
    else if (parity_ == LoadUiText(IDS_PARITY_ODD))
        station_.Parity = 1;
    else if (parity_ == LoadUiText(IDS_PARITY_EVEN))
        station_.Parity = 2;
    station_.Model = model_;
}

CStationDialog::CStationDialog(HWND parent, Station& station, bool newStation)
    : CPropertySheet(parent, std::wstring()),
      newStation_(newStation),
      openingName_(station.Name),
      station_(station),
      page_(station, newStation) {
    SetCaption(Caption());
    AddPage(page_);
}

std::wstring CStationDialog::Caption() const {
    return LoadUiText(newStation_ ? IDS_CREATE_DIGITAL_LEVEL : IDS_STATION_PROPERTIES);
}

void CStationDialog::OnInitialized() {
    SetFirstTabText(LoadUiText(IDS_GENERAL_TAB));
    SetCaption(Caption());
}

bool CStationDialog::AcceptName(const std::wstring& name) const {
    UINT refusal = 0;
    std::wstring text;
    if (name.empty()) {
        refusal = IDS_STATION_NAME_EMPTY;
    } else if (!IsValidStationName(name)) {
        refusal = IDS_STATION_NAME_SYMBOLS;
    } else if (newStation_) {
        // Only a new station must have a name of its own: a rename may match another station.
        Station existing;
        existing.Name = name;
        if (FindStation(existing) == S_OK) {
            refusal = IDS_STATION_EXISTS;
            text = FormatText(LoadUiText(IDS_STATION_EXISTS), {name});
        }
    }
    if (refusal == 0)
        return true;
    if (text.empty())
        text = LoadUiText(refusal);
    // The caption is the one of adding, in both modes.
    ShowMessageBox(Window(), text, LoadUiText(IDS_ADD_NEW_DIGITAL_LEVEL), MB_ICONERROR);
    return false;
}

bool CStationDialog::AcceptValues() const {
    const std::optional<StationFieldRefusal> refusal = RefusedStation(station_, ModelTexts());
    if (!refusal)
        return true;
    ShowMessageBox(
        Window(),
        FormatText(LoadUiText(IDS_STATION_VALUE_REFUSED),
                   {StationFieldOf(refusal->field).valueName, ReasonText(refusal->reason)}),
        Caption(), MB_ICONERROR);
    return false;
}

bool CStationDialog::OnApply(bool) {
    page_.ExchangeIntoRecord();
    if (!AcceptName(station_.Name) || !AcceptValues())
        return false;
    const HRESULT stored =
        newStation_ ? AddStation(station_) : UpdateStation(openingName_, station_);
    if (SUCCEEDED(stored)) {
        added_ = added_ || newStation_;
        // Applied under its new name: the next Apply or OK finds the station by that name.
        openingName_ = station_.Name;
        return true;
    }
    // Deleted in another view while the sheet was open: there is no station left to edit, and
    // the caller's refresh shows it gone.
    if (!newStation_ && stored == E_INVALIDARG)
        return true;
    // The store refused the write (logged there): said here, and the sheet stays open with the
    // user's values, to try again or cancel.
    ShowMessageBox(Window(),
                   StationsNotChangedText(IDS_STATION_NOT_STORED, {&station_.Name, 1}, stored),
                   Caption(), MB_ICONERROR);
    return false;
}
