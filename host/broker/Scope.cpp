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

using Entries = std::vector<Entry>;

/*
 * Both are trivial, so that they can still be asked when the thread's other objects are gone: a static object manager
 * is destroyed after the main thread's thread-local objects, and calls providers once more.
 */
thread_local Entries* stackOfThread = nullptr;
thread_local bool threadHasEnded = false;

/** Scopes that a thread leaves open end with the thread. */
struct EndOfThread {
    EndOfThread() = default;

    ~EndOfThread() {
        delete stackOfThread;
        stackOfThread = nullptr;
        threadHasEnded = true;
    }

    EndOfThread(const EndOfThread&) = delete;
    EndOfThread& operator=(const EndOfThread&) = delete;
};

Entries& entries() {
    if (stackOfThread == nullptr) {
        if (!threadHasEnded) {
            static thread_local const EndOfThread end;
            (void)end;
        }
        stackOfThread = new Entries; // of a thread that has ended: the process is about to
    }
    return *stackOfThread;
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
