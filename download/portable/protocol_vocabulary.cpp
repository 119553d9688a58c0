// The one place where the protocol's names meet the numbers stored and posted for them.
#include "download/portable/protocol_vocabulary.h"

namespace {

// The selectors as stations, the station list's clipboard block and lvstations' files store
// them; they must never change.
constexpr struct {
    ReceiveProcedure procedure;
    uint32_t stored;
} kStoredSelectors[] = {
    {ReceiveProcedure::RawStream, 0},
    {ReceiveProcedure::BccBlocks, 1},
    {ReceiveProcedure::YModem, 2},
    {ReceiveProcedure::RawStreamWithoutFlowControl, 3},
};

// The codes as the progress dialog receives them and lvrecv prints them.
constexpr struct {
    MessageCode code;
    uint32_t posted;
} kPostedCodes[] = {
    {MessageCode::Information, 1},
    {MessageCode::Error, 4},
    {MessageCode::PortNotOpened, 50},
};

}  // namespace

std::optional<ReceiveProcedure> ProcedureOfStoredSelector(uint32_t stored) noexcept {
    for (const auto& entry : kStoredSelectors)
        if (entry.stored == stored)
            return entry.procedure;
    return std::nullopt;
}

uint32_t StoredSelectorOf(ReceiveProcedure procedure) noexcept {
    for (const auto& entry : kStoredSelectors)
        if (entry.procedure == procedure)
            return entry.stored;
    // Every procedure has its entry; a value cast from elsewhere gets the download's default.
    return StoredSelectorOf(ReceiveProcedure::BccBlocks);
}

uint32_t PostedCodeOf(MessageCode code) noexcept {
    for (const auto& entry : kPostedCodes)
        if (entry.code == code)
            return entry.posted;
    // Every code has its entry; a value cast from elsewhere is shown as the error it must be.
    return PostedCodeOf(MessageCode::Error);
}

std::optional<MessageCode> MessageCodeOfPosted(uint64_t posted) noexcept {
    for (const auto& entry : kPostedCodes)
        if (entry.posted == posted)
            return entry.code;
    return std::nullopt;
}
