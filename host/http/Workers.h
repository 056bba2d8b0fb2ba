/**
 * @file
 * The threads of a server.
 */
#pragma once

#include "host/http/Loop.h"

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <unordered_set>
#include <vector>

namespace marlo::http {

/** How many jobs may be taken on. */
struct Places {
    std::size_t workers = 0; ///< that run
    std::size_t queued = 0;  ///< that wait for a worker
    std::size_t aside = 0;   ///< that have stepped aside
};

/**
 * Runs loops and the jobs that come out of them. A thread that owns a loop runs its jobs itself: most take less time
 * than it takes to wake up another thread. A watching thread notices those that take longer, and gives their loop to
 * another thread after a millisecond or two; the one that is held up goes on without it. So no job can hold up the
 * descriptors of its loop, and quick jobs cost no change of threads.
 *
 * No more than `workers` jobs run at once; those beyond wait in one queue for all loops. A job that waits for its
 * client steps aside: it goes on with its thread, but another one may run in its place. Threads are started when they
 * are first needed: one for each loop, one that watches, and one for each job that took its time.
 */
class Workers {
  public:
    Workers(std::size_t loops, const Places& places, std::function<void(const std::string&)> log);
    ~Workers();
    Workers(const Workers&) = delete;
    Workers& operator=(const Workers&) = delete;

    [[nodiscard]] const std::vector<std::unique_ptr<Loop>>& loops() const { return _loops; }

    /** By the thread that owns the job's loop. False when too many wait already. */
    bool submit(std::shared_ptr<Job> job);
    /**
     * Until it ends, this job, which runs, does not count as one of those that run at once. False when too many have
     * stepped aside already, and it counts on. By the job, once.
     */
    bool stepAside(const Job& job);
    /** Jobs that have been taken on and have not ended. Any thread. */
    [[nodiscard]] std::size_t busy() const;
    /** Those of them that have stepped aside. Any thread. */
    [[nodiscard]] std::size_t aside() const;

    /** Ends the loops, when no job runs or waits any more. */
    void stop();

  private:
    /** Runs on every thread but the one that watches. */
    void work();
    /** Returns when the loop has ended or has gone to another thread. */
    void own(Loop& loop);
    bool runOwned(Loop& loop, std::shared_ptr<Job> job);
    /** A job has ended: the next one that waits, which takes its place, or none. */
    std::shared_ptr<Job> next(const Job& ended);
    /** Takes the first one out of the queue, or gives the place up. With the mutex. */
    std::shared_ptr<Job> passPlaceOn();
    /** Calls done() of a job that ran on a thread that does not own its loop. */
    static void postDone(std::shared_ptr<Job> job);

    void watch();
    void handOver(Loop& loop, std::uint64_t turn);
    /** Whether there is a thread for one more loop, if need be a new one. With the mutex. */
    bool findThread();
    void startWatching();

    const Places _places;
    std::function<void(const std::string&)> _log;
    std::vector<std::unique_ptr<Loop>> _loops;

    mutable std::mutex _mutex;
    std::condition_variable _assigned;
    std::condition_variable _watched;
    std::deque<std::shared_ptr<Job>> _queue;
    std::deque<Loop*> _orphans; ///< loops that nobody owns
    std::unordered_set<const Job*> _aside;
    std::size_t _busy = 0;   ///< jobs that have a place
    std::size_t _parked = 0; ///< threads that wait for a loop
    std::vector<std::thread> _threads;
    std::thread _watcher;
    std::atomic<bool> _isWatching{false};
    bool _isStopping = false;
    bool _cannotStart = false; ///< the system gives no more threads
};

} // namespace marlo::http
