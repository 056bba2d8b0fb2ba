/**
 * @file
 * The broker's memory services. What they hand out ends with the scope of the thread that asked, unless freed before.
 */
#include "host/broker/BrokerState.h"
#include "host/broker/Slot.h"

#include <atomic>
#include <cstring>

namespace marlo::broker {

namespace {

/** From now on what is created belongs to the mark, which is a number that no other mark of the process has. */
CMPIGcStat* mark(CMPIStatus& /*status*/, BrokerState& /*broker*/) {
    static std::atomic<std::uintptr_t> last{0};
    auto* token = reinterpret_cast<void*>(++last); // NOLINT(performance-no-int-to-ptr): never followed
    openScope(token);
    return token;
}

CMPIrc release(BrokerState& /*broker*/, const CMPIGcStat* token) {
    if (token == nullptr) {
        return CMPI_RC_ERR_INVALID_PARAMETER;
    }
    return closeScope(token, true) ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_PARAMETER;
}

void* cmpiMalloc(const CMPIBroker* /*broker*/, std::size_t bytes) {
    return currentArena().allocatePiece(bytes, false);
}

void* cmpiCalloc(const CMPIBroker* /*broker*/, std::size_t count, std::size_t bytes) {
    std::size_t total = 0;
    return __builtin_mul_overflow(count, bytes, &total) ? nullptr : currentArena().allocatePiece(total, true);
}

/** Null for what was not allocated here or is freed already. */
void* cmpiRealloc(const CMPIBroker* /*broker*/, void* piece, std::size_t bytes) {
    return piece == nullptr ? currentArena().allocatePiece(bytes, false) : resizePiece(piece, bytes);
}

char* cmpiStrDup(const CMPIBroker* /*broker*/, const char* text) {
    if (text == nullptr) {
        return nullptr;
    }
    const std::size_t size = std::strlen(text) + 1;
    auto* copied = static_cast<char*>(currentArena().allocatePiece(size, false));
    if (copied != nullptr) {
        std::memcpy(copied, text, size);
    }
    return copied;
}

/** Does nothing with what was not allocated here or is freed already. */
void cmpiFree(const CMPIBroker* /*broker*/, void* piece) {
    freePiece(piece);
}

template <typename O>
void freeObject(const CMPIBroker* /*broker*/, typename O::Handle* handle) {
    releaseSlot<O>(handle);
}

} // namespace

const CMPIBrokerMemFT memoryTable = {
    CMPI_VERSION,
    slot<mark>,
    slot<release>,
    cmpiMalloc,
    cmpiCalloc,
    cmpiRealloc,
    cmpiStrDup,
    cmpiFree,
    freeObject<InstanceObject>,
    freeObject<ObjectPathObject>,
    freeObject<ArgsObject>,
    freeObject<StringObject>,
    freeObject<ArrayObject>,
    freeObject<DateTimeObject>,
    freeObject<SelectExpObject>,
};

} // namespace marlo::broker
