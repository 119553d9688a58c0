// The serial driver's only way to speak: messages, progress and the question whether to stop.
#pragma once

#include <cstdint>

#include "support/portable/wide_text.h"

// Message codes passed with ShowMessage.
constexpr uint32_t kMessageInformation = 1;  // information or progress text
constexpr uint32_t kMessageError = 4;
constexpr uint32_t kMessagePortNotOpened = 50;

// Implemented by whoever runs the driver (the download thread); called on the driver's thread.
class TParserCallBack {
public:
    virtual ~TParserCallBack() = default;
    // text is zero-terminated and lives only for the call.
    virtual void ShowMessage(uint32_t code, const WideChar* text) = 0;
    // The line protocol always passes total 100.
    virtual void SetProgress(uint32_t total, uint32_t current) = 0;
    virtual bool IsCancelled() = 0;
};
