/**
 * @file
 * One thread's worth of readiness: descriptors, a timer, and what other threads ask for.
 */
#pragma once

#include "host/http/Descriptor.h"

#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <functional>
#include <memory>
#include <span>

namespace marlo::http {

class Loop;

/** What a worker does for a connection. */
class Job {
  public:
    virtual ~Job() = default;

    /** On a worker, which it may hold up. Throws nothing. */
    virtual void run() = 0;
    /** Afterwards, in the hands of `loop`. */
    virtual void done() = 0;
    [[nodiscard]] virtual Loop& loop() const = 0;

  protected:
    Job() = default;
    Job(const Job&) = default;
    Job& operator=(const Job&) = default;
};

/**
 * Runs what is due, one thing at a time. At any time one thread at most owns a loop; a loop changes hands when its
 * thread is held up by a job (see Workers). Everything but `post` and `end` is for the thread that owns it.
 */
class Loop {
  public:
    Loop();
    ~Loop();
    Loop(const Loop&) = delete;
    Loop& operator=(const Loop&) = delete;

    /** Waits until something is due and runs it. False when the loop has ended. */
    bool runOne();

    /** Any thread. */
    void post(std::function<void()> what);
    /** runOne() returns false from now on. Any thread. */
    void end();

    /** Jobs that may start, in their order. */
    std::deque<std::shared_ptr<Job>>& ready() { return _ready; }

    /** Odd while its thread is in a job; whoever makes it even again owns the loop from then on. */
    std::atomic<std::uint64_t>& turn() { return _turn; }

    /** Room to read into, shared by all connections of the loop. */
    std::span<char> scratch() { return {_scratch.get(), scratchSize}; }

  private:
    friend class Readiness;
    friend class Timer;
    struct Asio;

    static constexpr std::size_t scratchSize = std::size_t{64} * 1024;

    std::unique_ptr<Asio> _asio;
    std::deque<std::shared_ptr<Job>> _ready;
    std::atomic<std::uint64_t> _turn{0};
    std::unique_ptr<char[]> _scratch; ///< of which only what has been read into takes memory
};

/** In the hands of its loop only. */
class Timer {
  public:
    explicit Timer(Loop& loop);
    ~Timer();
    Timer(const Timer&) = delete;
    Timer& operator=(const Timer&) = delete;

    /** Runs `what` once, this much later, in place of what was to be run before. */
    void after(std::chrono::milliseconds delay, std::function<void()> what);

  private:
    struct Asio;

    std::unique_ptr<Asio> _asio;
};

/** Is told that a descriptor is ready. */
class ReadinessListener {
  public:
    virtual ~ReadinessListener() = default;
    virtual void onReady() = 0;

  protected:
    ReadinessListener() = default;
    ReadinessListener(const ReadinessListener&) = default;
    ReadinessListener& operator=(const ReadinessListener&) = default;
};

/** Owns a descriptor and waits for it in a loop. In the hands of the loop only. */
class Readiness {
  public:
    Readiness(Loop& loop, Descriptor descriptor);
    ~Readiness();
    Readiness(const Readiness&) = delete;
    Readiness& operator=(const Readiness&) = delete;

    /** -1 once closed. */
    [[nodiscard]] int descriptor() const;
    /** Tells the listener once, and keeps it alive until then. */
    void awaitReadable(std::shared_ptr<ReadinessListener> listener);
    void awaitWritable(std::shared_ptr<ReadinessListener> listener);
    /** Nobody is told any more. */
    void close();

  private:
    struct Asio;

    std::unique_ptr<Asio> _asio;
};

} // namespace marlo::http
