/**
 * @file
 * The broker's threads and locks, on POSIX threads. Functions that answer int answer an errno value.
 */
#include "host/broker/BrokerState.h"
#include "host/broker/Threads.h"

#include <cerrno>
#include <condition_variable>
#include <cstring>
#include <ctime>
#include <iostream>
#include <memory>

#include <cxxabi.h>
#include <pthread.h>

namespace marlo::broker {

namespace {

static_assert(sizeof(pthread_t) == sizeof(void*));
static_assert(sizeof(pthread_key_t) == sizeof(unsigned int));
static_assert(sizeof(pthread_once_t) == sizeof(int) && PTHREAD_ONCE_INIT == 0);

pthread_t threadOf(void* thread) {
    return reinterpret_cast<pthread_t>(thread);
}

/** Never destroyed: detached threads may end after all static objects. */
struct RunningThreads {
    std::mutex mutex;
    std::condition_variable allEnded;
    std::size_t count = 0;

    static RunningThreads& get() {
        static RunningThreads& threads = *std::make_unique<RunningThreads>().release();
        return threads;
    }
};

/** Counts a thread from before it starts until its function has ended. */
class RunningThread {
  public:
    RunningThread() {
        const std::lock_guard lock(RunningThreads::get().mutex);
        ++RunningThreads::get().count;
    }

    ~RunningThread() {
        const std::lock_guard lock(RunningThreads::get().mutex);
        if (--RunningThreads::get().count == 0) {
            RunningThreads::get().allEnded.notify_all();
        }
    }

    RunningThread(const RunningThread&) = delete;
    RunningThread& operator=(const RunningThread&) = delete;
};

struct Start {
    Start(CMPIThreadFunc begin, void* given) : function(begin), argument(given) {}

    CMPIThreadFunc function;
    void* argument;
    RunningThread running;
};

/**
 * What a provider's thread throws ends that thread, not the process. A forced unwinding has no object behind its
 * exception, which UndefinedBehaviorSanitizer takes for a null reference.
 */
__attribute__((no_sanitize("null"))) void* runThread(void* argument) {
    const std::unique_ptr<Start> start(static_cast<Start*>(argument));
    try {
        return start->function(start->argument);
    } catch (const abi::__forced_unwind&) {
        throw; // exitThread and cancelThread unwind by this
    } catch (const std::exception& error) {
        std::cerr << std::string("a provider's thread ended with an exception: ") + error.what() + "\n";
    } catch (...) {
        std::cerr << "a provider's thread ended with an exception of unknown type\n";
    }
    return nullptr;
}

/** Null when there is no thread to be had. */
void* newThread(CMPIThreadFunc function, void* argument, int detached) {
    if (function == nullptr) {
        return nullptr;
    }
    pthread_attr_t attributes;
    if (pthread_attr_init(&attributes) != 0) {
        return nullptr;
    }
    pthread_attr_setdetachstate(&attributes, detached != 0 ? PTHREAD_CREATE_DETACHED : PTHREAD_CREATE_JOINABLE);
    auto start = std::make_unique<Start>(function, argument);
    pthread_t thread{};
    const int code = pthread_create(&thread, &attributes, runThread, start.get());
    pthread_attr_destroy(&attributes);
    if (code != 0) {
        return nullptr;
    }
    static_cast<void>(start.release());     // the thread's now
    return reinterpret_cast<void*>(thread); // NOLINT(performance-no-int-to-ptr): CMPI has threads as pointers
}

int joinThread(void* thread, void** value) {
    return thread == nullptr ? ESRCH : pthread_join(threadOf(thread), value);
}

int exitThread(void* value) {
    pthread_exit(value);
}

int cancelThread(void* thread) {
    return thread == nullptr ? ESRCH : pthread_cancel(threadOf(thread));
}

int threadSleep(CMPIUint32 milliseconds) {
    timespec left{static_cast<time_t>(milliseconds / 1000), static_cast<long>(milliseconds % 1000) * 1'000'000};
    int code = 0;
    do {
        code = clock_nanosleep(CLOCK_MONOTONIC, 0, &left, &left);
    } while (code == EINTR);
    return code;
}

int threadOnce(int* once, CMPIThreadOnceFunc function) {
    return once == nullptr || function == nullptr ? EINVAL
                                                  : pthread_once(reinterpret_cast<pthread_once_t*>(once), function);
}

int createThreadKey(unsigned int* key, CMPIThreadKeyCleanupFunc cleanup) {
    return key == nullptr ? EINVAL : pthread_key_create(key, cleanup);
}

int destroyThreadKey(unsigned int key) {
    return pthread_key_delete(key);
}

void* getThreadSpecific(unsigned int key) {
    return pthread_getspecific(key);
}

int setThreadSpecific(unsigned int key, void* value) {
    return pthread_setspecific(key, value);
}

pthread_mutex_t* mutexOf(void* mutex) {
    return static_cast<pthread_mutex_t*>(mutex);
}

pthread_cond_t* conditionOf(void* condition) {
    return static_cast<pthread_cond_t*>(condition);
}

void* newMutex(int /*options*/) {
    auto mutex = std::make_unique<pthread_mutex_t>();
    return pthread_mutex_init(mutex.get(), nullptr) == 0 ? mutex.release() : nullptr;
}

void destroyMutex(void* mutex) {
    if (mutex != nullptr) {
        const std::unique_ptr<pthread_mutex_t> owned(mutexOf(mutex));
        pthread_mutex_destroy(owned.get());
    }
}

void lockMutex(void* mutex) {
    if (mutex != nullptr) {
        pthread_mutex_lock(mutexOf(mutex));
    }
}

void unlockMutex(void* mutex) {
    if (mutex != nullptr) {
        pthread_mutex_unlock(mutexOf(mutex));
    }
}

void* newCondition(int /*options*/) {
    auto condition = std::make_unique<pthread_cond_t>();
    return pthread_cond_init(condition.get(), nullptr) == 0 ? condition.release() : nullptr;
}

void destroyCondition(void* condition) {
    if (condition != nullptr) {
        const std::unique_ptr<pthread_cond_t> owned(conditionOf(condition));
        pthread_cond_destroy(owned.get());
    }
}

int condWait(void* condition, void* mutex) {
    return condition == nullptr || mutex == nullptr ? EINVAL
                                                    : pthread_cond_wait(conditionOf(condition), mutexOf(mutex));
}

/** `end` is a time of CLOCK_REALTIME; ETIMEDOUT once it is past. */
int timedCondWait(void* condition, void* mutex, timespec* end) {
    return condition == nullptr || mutex == nullptr || end == nullptr
               ? EINVAL
               : pthread_cond_timedwait(conditionOf(condition), mutexOf(mutex), end);
}

int signalCondition(void* condition) {
    return condition == nullptr ? EINVAL : pthread_cond_signal(conditionOf(condition));
}

/** The file name of a library, in the memory of the current scope. */
char* resolveFileName(const char* name) {
    if (name == nullptr) {
        return nullptr;
    }
    const std::string file = "lib" + std::string(name) + ".so";
    auto* copied = static_cast<char*>(currentArena().allocatePiece(file.size() + 1, false));
    if (copied != nullptr) {
        std::memcpy(copied, file.c_str(), file.size() + 1);
    }
    return copied;
}

} // namespace

const CMPIBrokerExtFT threadTable = {
    CMPI_VERSION, resolveFileName, newThread,       joinThread,       exitThread,        cancelThread,
    threadSleep,  threadOnce,      createThreadKey, destroyThreadKey, getThreadSpecific, setThreadSpecific,
    newMutex,     destroyMutex,    lockMutex,       unlockMutex,      newCondition,      destroyCondition,
    condWait,     timedCondWait,   signalCondition,
};

bool waitForThreads(std::chrono::milliseconds longest) {
    RunningThreads& threads = RunningThreads::get();
    std::unique_lock lock(threads.mutex);
    return threads.allEnded.wait_for(lock, longest, [&threads] { return threads.count == 0; });
}

} // namespace marlo::broker
