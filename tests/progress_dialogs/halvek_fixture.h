// The fixture of the external-library dialog's tests: a station of a library model, the
// substitute library's settings and call log, and the files it writes.
#pragma once

#include <windows.h>

#include <filesystem>
#include <string>

#include "res/resource.h"
#include "stations/portable/station.h"
#include "support/text_lookup.h"
#include "tests/progress_dialogs/dialog_driver.h"

class HalvekDialog : public DialogTest {
protected:
    void SetUp() override {
        DialogTest::SetUp();
        ::SetEnvironmentVariableW(L"HALVEKCOMM_LOG", log_.c_str());
        station_.Name = L"North benchmark";
        station_.Port = L"COM12";
        station_.Model = LoadUiText(IDS_MODEL_LV20);
    }
    void TearDown() override {
        for (const wchar_t* name :
             {L"HALVEKCOMM_LOG", L"HALVEKCOMM_RESULT", L"HALVEKCOMM_START_RESULT",
              L"HALVEKCOMM_FAIL", L"HALVEKCOMM_DELAY_MS", L"HALVEKCOMM_CANCEL_DELAY_MS",
              L"HALVEKCOMM_IGNORE_CANCEL"})
            ::SetEnvironmentVariableW(name, nullptr);
        std::error_code ignored;
        std::filesystem::remove(written_, ignored);
        std::filesystem::remove(log_, ignored);
    }

    Station station_;
    const std::filesystem::path output_ = TemporaryFile(L"halvek.hvr");
    // The library adds ".txt".
    const std::filesystem::path written_ = output_.wstring() + L".txt";
    const std::filesystem::path log_ = TemporaryFile(L"halvek.log");
};
