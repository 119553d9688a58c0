// CStationDialog: the property sheet in which a surveyor creates a station or edits one, with its
// one page, CStationGeneralPage (name, model, port, baud rate, parity).
#pragma once

#include <windows.h>

#include <string>

#include "stations/portable/station.h"
#include "support/property_sheet.h"

class CStationGeneralPage : public CPropertyPage {
public:
    // The page edits the caller's record in place.
    CStationGeneralPage(Station& station, bool newStation);

    // Controls → exchange texts → record, with the conversions of the sheet: an unknown baud text
    // reads as 0, the marked absent port as the stored port, parity by its current text (no
    // selection keeps the record's).
    void ExchangeIntoRecord();

protected:
    void OnInitDialog() override;
    void OnCommand(WORD controlId, WORD notification) override;

private:
    // The computer's ports now, plus the stored port marked when it is not among them; the
    // selection is kept.
    void FillPortList();
    std::wstring AbsentPortText() const;

    Station& station_;
    bool newStation_;
    std::wstring storedPort_;  // the record's port when the page opened
    std::wstring name_;
    std::wstring port_;
    std::wstring baudRate_;
    std::wstring parity_;
    std::wstring model_;
};

class CStationDialog : public CPropertySheet {
public:
    // parent may be null; station is the caller's record, edited in place.
    CStationDialog(HWND parent, Station& station, bool newStation);

    // True once the station was added (new-station mode).
    bool Added() const noexcept { return added_; }

protected:
    void OnInitialized() override;
    bool OnApply(bool closing) override;

private:
    // Shows the refusal for a name that cannot be stored; true when the name may be stored.
    bool AcceptName(const std::wstring& name) const;
    // Shows the refusal for any other value the station may not hold; true when none.
    bool AcceptValues() const;
    std::wstring Caption() const;

    bool newStation_;
    std::wstring openingName_;
    Station& station_;
    CStationGeneralPage page_;
    bool added_ = false;
};
