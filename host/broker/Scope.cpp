#include "host/broker/Scope.h"

#include <algorithm>
#include <memory>
#include <vector>

namespace marlo::broker {

namespace {

struct Entry {
    std::unique_ptr<Arena> arena;
    const void* tag; ///< null for a call and for the thread's own scope
};

/** Scopes that a thread leaves open end with the thread. */
std::vector<Entry>& entries() {
    thread_local std::vector<Entry> stack;
    return stack;
}

void open(const void* tag) {
    entries().push_back({std::make_unique<Arena>(Arena::Use::call), tag});
}

void truncate(std::size_t depth) {
    auto& stack = entries();
    while (stack.size() > depth) {
        stack.pop_back();
    }
}

} // namespace

CallScope::CallScope() : _depth(entries().size()) {
    open(nullptr);
}

CallScope::~CallScope() {
    truncate(_depth);
}

Arena& currentArena() {
    if (entries().empty()) {
        open(nullptr);
    }
    return *entries().back().arena;
}

void openScope(const void* tag) {
    open(tag);
}

bool closeScope(const void* tag, bool withLater) {
    auto& stack = entries();
    // A scope that was opened before the running call is not the running call's to close.
    for (std::size_t i = stack.size(); i-- > 0 && stack[i].tag != nullptr;) {
        if (stack[i].tag == tag) {
            const auto first = stack.begin() + static_cast<std::ptrdiff_t>(i);
            stack.erase(first, withLater ? stack.end() : first + 1);
            return true;
        }
    }
    return false;
}

void* resizePiece(void* piece, std::size_t bytes) {
    auto& stack = entries();
    const auto owner = std::find_if(stack.begin(), stack.end(),
                                    [piece](const Entry& entry) { return entry.arena->ownsPiece(piece); });
    return owner == stack.end() ? nullptr : owner->arena->resizePiece(piece, bytes);
}

void freePiece(void* piece) {
    for (const Entry& entry : entries()) {
        if (entry.arena->freePiece(piece)) {
            return;
        }
    }
}

} // namespace marlo::broker
