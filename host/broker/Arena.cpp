#include "host/broker/Arena.h"

#include <algorithm>
#include <cstdlib>

namespace marlo::broker {

namespace {

constexpr std::size_t callBlock = 4096;
constexpr std::size_t sharedBlock = 512;
constexpr std::size_t largestBlock = std::size_t{64} * 1024;
/** Nothing in CMPI is aligned more strictly than pointers and 64-bit numbers. */
constexpr std::size_t alignment = alignof(std::uint64_t);

constexpr std::size_t aligned(std::size_t bytes) {
    return (bytes + alignment - 1) / alignment * alignment;
}

} // namespace

struct Arena::Block {
    Block* next;
};

Arena::Arena(Use use) : _own{.nextSize = callBlock}, _shared{.nextSize = sharedBlock} {
    if (use == Use::call) {
        _owner = std::this_thread::get_id();
    }
}

Arena::~Arena() {
    release(_own);
    release(_shared);
    for (void* piece : _pieces) {
        std::free(piece);
    }
}

void Arena::release(Part& part) {
    while (part.blocks != nullptr) {
        Block* next = part.blocks->next;
        std::free(part.blocks);
        part.blocks = next;
    }
}

void* Arena::allocate(std::size_t bytes) {
    if (isOwner()) {
        return allocate(_own, bytes);
    }
    const std::lock_guard lock(_mutex);
    return allocate(_shared, bytes);
}

void* Arena::allocate(Part& part, std::size_t bytes) {
    const std::size_t taken = aligned(bytes);
    if (taken < bytes) {
        throw std::bad_alloc();
    }
    if (taken > static_cast<std::size_t>(part.end - part.at)) {
        return allocateBlock(part, taken);
    }
    void* memory = part.at;
    part.at += taken;
    return memory;
}

/** Starts a new block, or gives a large request a block of its own and goes on with the one that is open. */
void* Arena::allocateBlock(Part& part, std::size_t bytes) {
    const bool large = bytes > part.nextSize / 2;
    const std::size_t room = large ? bytes : part.nextSize - sizeof(Block);
    auto* block = static_cast<Block*>(std::malloc(sizeof(Block) + room));
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    block->next = part.blocks;
    part.blocks = block;
    auto* memory = reinterpret_cast<std::byte*>(block + 1);
    if (!large) {
        part.at = memory + bytes;
        part.end = memory + room;
        part.nextSize = std::min(part.nextSize * 2, largestBlock);
    }
    return memory;
}

void Arena::keep(std::shared_ptr<const void> thing) {
    const std::lock_guard lock(_mutex);
    _kept.push_back(std::move(thing));
}

Arena::RecurringTexts* Arena::recurringTexts() {
    if (!isOwner()) {
        return nullptr;
    }
    if (_recurring == nullptr) {
        _recurring = make<RecurringTexts>();
    }
    return _recurring;
}

void* Arena::allocatePiece(std::size_t bytes, bool zeroed) {
    // malloc(0) may be null, which would look like a failure.
    void* piece =
        zeroed ? std::calloc(1, std::max<std::size_t>(bytes, 1)) : std::malloc(std::max<std::size_t>(bytes, 1));
    if (piece != nullptr) {
        const std::lock_guard lock(_mutex);
        _pieces.insert(piece);
    }
    return piece;
}

void* Arena::resizePiece(void* piece, std::size_t bytes) {
    const std::lock_guard lock(_mutex);
    const auto found = _pieces.find(piece);
    if (found == _pieces.end()) {
        return nullptr;
    }
    void* resized = std::realloc(piece, std::max<std::size_t>(bytes, 1));
    if (resized != nullptr && resized != piece) {
        _pieces.erase(found);
        _pieces.insert(resized);
    }
    return resized;
}

bool Arena::freePiece(void* piece) {
    const std::lock_guard lock(_mutex);
    if (_pieces.erase(piece) == 0) {
        return false;
    }
    std::free(piece);
    return true;
}

bool Arena::ownsPiece(const void* piece) {
    const std::lock_guard lock(_mutex);
    return _pieces.count(const_cast<void*>(piece)) != 0;
}

} // namespace marlo::broker
