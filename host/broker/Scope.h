/**
 * @file
 * Whose memory is used now: the stack of scopes of each thread.
 */
#pragma once

#include "host/broker/Arena.h"

#include <cstddef>

namespace marlo::broker {

/**
 * Everything that a provider has the broker create on this thread between construction and destruction belongs to the
 * scope and is released with it. Scopes nest; destruction ends those that were opened inside and left open. Must be
 * destroyed on the thread that constructed it.
 *
 * A thread outside any scope has one of its own that ends with the thread.
 */
class CallScope {
  public:
    CallScope();
    ~CallScope();
    CallScope(const CallScope&) = delete;
    CallScope& operator=(const CallScope&) = delete;

  private:
    std::size_t _depth;
};

/** The memory of the innermost scope of this thread. */
Arena& currentArena();

/** Opens a scope that is known by `tag` and not bound to a block: an attached context or a mark. */
void openScope(const void* tag);

/** Ends the innermost scope known by `tag` and, for a mark, those opened after it; false when there is none. */
bool closeScope(const void* tag, bool withLater);

/** Frees or finds single pieces of memory in any scope of this thread. */
void* resizePiece(void* piece, std::size_t bytes);
void freePiece(void* piece);

} // namespace marlo::broker
