/**
 * @file
 * Memory that is released as a whole: that of one call, or of one clone.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <new>
#include <string_view>
#include <thread>
#include <type_traits>
#include <unordered_set>
#include <utility>
#include <vector>

namespace marlo::broker {

class StringObject;

/**
 * Hands out memory from growing blocks and releases all of it at once. What lies in it is never destroyed one by one,
 * so it must be trivially destructible; what is not is kept beside it.
 *
 * The thread that a call runs on allocates without locking. An object may be changed by another thread than the one
 * whose call owns it; what that takes comes from a part of its own, under a lock.
 */
class Arena {
  public:
    /** Who allocates: mostly the constructing thread (calls), or now this, now that thread (clones). */
    enum class Use { call, clone };

    explicit Arena(Use use);
    ~Arena();
    Arena(const Arena&) = delete;
    Arena& operator=(const Arena&) = delete;

    /** Uninitialised memory, aligned for pointers and 64-bit numbers. Throws std::bad_alloc. */
    void* allocate(std::size_t bytes);

    template <typename T, typename... Arguments>
    T* make(Arguments&&... arguments) {
        static_assert(std::is_trivially_destructible_v<T> && alignof(T) <= alignof(std::uint64_t));
        return ::new (allocate(sizeof(T))) T(std::forward<Arguments>(arguments)...);
    }

    template <typename T>
    T* makeArray(std::size_t count) {
        static_assert(std::is_trivially_destructible_v<T> && alignof(T) <= alignof(std::uint64_t));
        // NOLINTNEXTLINE(bugprone-sizeof-expression): T may well be a pointer
        T* array = static_cast<T*>(allocate(count * sizeof(T)));
        std::uninitialized_value_construct_n(array, count);
        return array;
    }

    /** Strings by which texts that recur in this arena are found again. */
    struct RecurringTexts {
        static constexpr std::size_t size = 64; ///< a power of two

        StringObject* names[size] = {};
        StringObject* values[size] = {}; ///< apart, since values that do not recur push others out
    };

    /** Null when the caller may not use them. */
    RecurringTexts* recurringTexts();

    /** Keeps a thing alive as long as the arena. */
    void keep(std::shared_ptr<const void> thing);

    /** The object whose release ends this arena; null for the arena of a call, whose objects end with the call. */
    [[nodiscard]] const void* root() const { return _root; }

    void setRoot(const void* root) { _root = root; }

    /** Single pieces of memory that may be freed or resized before the arena ends; null where memory is out. */
    void* allocatePiece(std::size_t bytes, bool zeroed);
    /** Null also when the piece is not of this arena (or was freed): nothing is done then. */
    void* resizePiece(void* piece, std::size_t bytes);
    /** False when the piece is not of this arena. */
    bool freePiece(void* piece);
    [[nodiscard]] bool ownsPiece(const void* piece);

  private:
    struct Block;

    struct Part {
        Block* blocks = nullptr;
        std::byte* at = nullptr;
        std::byte* end = nullptr;
        std::size_t nextSize;
    };

    [[nodiscard]] bool isOwner() const { return _owner == std::this_thread::get_id(); }

    static void* allocate(Part& part, std::size_t bytes);
    static void* allocateBlock(Part& part, std::size_t bytes);
    static void release(Part& part);

    std::thread::id _owner;
    Part _own;
    Part _shared;
    std::mutex _mutex; ///< guards _shared, _pieces and _kept
    std::unordered_set<void*> _pieces;
    std::vector<std::shared_ptr<const void>> _kept;
    RecurringTexts* _recurring = nullptr;
    const void* _root = nullptr;
};

} // namespace marlo::broker
