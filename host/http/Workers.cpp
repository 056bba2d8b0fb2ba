#include "host/http/Workers.h"

#include <chrono>
#include <system_error>
#include <utility>

namespace marlo::http {
namespace {

/** A job that is seen twice at this distance is held up. */
constexpr std::chrono::milliseconds glance{1};
/** So many glances at nothing, and the watching thread sleeps until there is a job again. */
constexpr int quietGlances = 50;

bool isInJob(std::uint64_t turn) {
    return turn % 2 == 1;
}

} // namespace

Workers::Workers(std::size_t loops, const Places& places, std::function<void(const std::string&)> log)
    : _places(places), _log(std::move(log)) {
    for (std::size_t count = 0; count < loops; ++count) {
        _loops.push_back(std::make_unique<Loop>());
        _orphans.push_back(_loops.back().get());
    }
    _threads.reserve(loops + places.workers + places.aside);
    for (std::size_t count = 0; count < loops; ++count) {
        _threads.emplace_back(&Workers::work, this);
    }
    _watcher = std::thread(&Workers::watch, this);
}

Workers::~Workers() {
    stop();
}

void Workers::stop() {
    {
        const std::lock_guard lock(_mutex);
        _isStopping = true;
    }
    for (const auto& loop : _loops) {
        loop->end();
    }
    _assigned.notify_all();
    _watched.notify_all();
    if (_watcher.joinable()) {
        _watcher.join();
    }
    for (std::thread& thread : _threads) {
        if (thread.joinable()) {
            thread.join();
        }
    }
}

bool Workers::submit(std::shared_ptr<Job> job) {
    const std::lock_guard lock(_mutex);
    if (_busy < _places.workers) {
        ++_busy;
        auto& ready = job->loop().ready();
        ready.push_back(std::move(job));
        return true;
    }
    if (_queue.size() >= _places.queued) {
        return false;
    }
    _queue.push_back(std::move(job));
    return true;
}

std::size_t Workers::busy() const {
    const std::lock_guard lock(_mutex);
    return _busy + _queue.size() + _aside.size();
}

std::size_t Workers::aside() const {
    const std::lock_guard lock(_mutex);
    return _aside.size();
}

bool Workers::stepAside(const Job& job) {
    std::shared_ptr<Job> following;
    {
        const std::lock_guard lock(_mutex);
        if (_aside.size() >= _places.aside) {
            return false;
        }
        _aside.insert(&job);
        following = passPlaceOn();
    }
    if (following) {
        Loop& loop = following->loop();
        loop.post([&loop, following = std::move(following)] { loop.ready().push_back(following); });
    }
    return true;
}

void Workers::work() {
    std::unique_lock lock(_mutex);
    while (true) {
        ++_parked;
        _assigned.wait(lock, [this] { return _isStopping || !_orphans.empty(); });
        --_parked;
        if (_isStopping) {
            return;
        }
        Loop* loop = _orphans.front();
        _orphans.pop_front();
        lock.unlock();
        own(*loop);
        lock.lock();
    }
}

void Workers::own(Loop& loop) {
    do {
        while (!loop.ready().empty()) {
            std::shared_ptr<Job> job = std::move(loop.ready().front());
            loop.ready().pop_front();
            if (!runOwned(loop, std::move(job))) {
                return;
            }
        }
    } while (loop.runOne());
}

bool Workers::runOwned(Loop& loop, std::shared_ptr<Job> job) {
    std::uint64_t inJob = loop.turn().load() + 1;
    loop.turn().store(inJob);
    if (!_isWatching) {
        startWatching();
    }
    job->run();
    const bool isMine = loop.turn().compare_exchange_strong(inJob, inJob + 1);
    std::shared_ptr<Job> following = next(*job);
    if (isMine) {
        if (following) {
            loop.ready().push_back(std::move(following));
        }
        if (&job->loop() == &loop) {
            job->done();
        } else {
            postDone(std::move(job));
        }
        return true;
    }
    postDone(std::move(job));
    while (following) {
        following->run();
        std::shared_ptr<Job> ended = std::move(following);
        following = next(*ended);
        postDone(std::move(ended));
    }
    return false;
}

std::shared_ptr<Job> Workers::next(const Job& ended) {
    const std::lock_guard lock(_mutex);
    return _aside.erase(&ended) == 0 ? passPlaceOn() : nullptr;
}

std::shared_ptr<Job> Workers::passPlaceOn() {
    if (_queue.empty()) {
        --_busy;
        return nullptr;
    }
    std::shared_ptr<Job> job = std::move(_queue.front());
    _queue.pop_front();
    return job;
}

void Workers::postDone(std::shared_ptr<Job> job) {
    Loop& loop = job->loop();
    loop.post([job = std::move(job)] { job->done(); });
}

void Workers::startWatching() {
    const std::lock_guard lock(_mutex);
    _isWatching = true;
    _watched.notify_one();
}

void Workers::watch() {
    std::vector<std::uint64_t> seen(_loops.size());
    int quiet = 0;
    std::unique_lock lock(_mutex);
    while (!_isStopping) {
        _watched.wait_for(lock, glance, [this] { return _isStopping; });
        bool isQuiet = true;
        for (std::size_t index = 0; index < _loops.size(); ++index) {
            const std::uint64_t turn = _loops[index]->turn();
            isQuiet = isQuiet && turn == seen[index] && !isInJob(turn);
            if (isInJob(turn) && turn == seen[index] && findThread()) {
                handOver(*_loops[index], turn);
            }
            seen[index] = turn;
        }
        quiet = isQuiet ? quiet + 1 : 0;
        if (quiet < quietGlances) {
            continue;
        }
        _isWatching = false; // from here on a job that begins says so; one that began before is seen now
        for (std::size_t index = 0; index < _loops.size(); ++index) {
            _isWatching = _isWatching || _loops[index]->turn() != seen[index];
        }
        _watched.wait(lock, [this] { return _isStopping || _isWatching; });
        quiet = 0;
    }
}

bool Workers::findThread() {
    if (_parked > _orphans.size()) {
        return true;
    }
    if (_threads.size() >= _loops.size() + _places.workers + _places.aside) {
        return false; // one has ended its job and will be there at the next glance
    }
    try {
        _threads.emplace_back(&Workers::work, this);
        _cannotStart = false;
        return true;
    } catch (const std::system_error& error) {
        if (!std::exchange(_cannotStart, true)) {
            _log(std::string("cannot start another thread: ") + error.what());
        }
        return false;
    }
}

void Workers::handOver(Loop& loop, std::uint64_t turn) {
    if (loop.turn().compare_exchange_strong(turn, turn + 1)) {
        _orphans.push_back(&loop);
        _assigned.notify_one();
    }
}

} // namespace marlo::http
