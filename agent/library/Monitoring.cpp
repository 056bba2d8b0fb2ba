#include "agent/library/Monitoring.h"

#include "agent/library/BackEndHolder.h"
#include "agent/library/Log.h"
#include "agent/library/PerProcess.h"

#include <ctime>
#include <memory>
#include <string>

#include <pthread.h>

namespace Orv::Agent {

namespace {

constexpr long secondsPerHour = 3600;

void report(int level, const std::string& text) {
    Log::instance().log({"Monitor", "agent/events/Monitor.cpp", __LINE__, "Hearth.Agent", level, text});
}

} // namespace

Monitor& processMonitor() {
    BackEnd& backEnd = processBackEnd();
    static PerProcess<Monitor> monitor;
    static const int registered =
        ::pthread_atfork([] { monitor.beforeFork(); }, [] { monitor.inParent(); }, [] { monitor.inChild(); });
    static_cast<void>(registered);
    return monitor.get([&] { return std::make_unique<Monitor>(backEnd, report); });
}

DateTime::Fields localTime(std::chrono::system_clock::time_point time) {
    using namespace std::chrono;
    const auto milliseconds = floor<std::chrono::milliseconds>(time.time_since_epoch());
    const auto seconds = floor<std::chrono::seconds>(milliseconds);
    const time_t whole = seconds.count();
    tm calendar{};
    ::localtime_r(&whole, &calendar);
    const auto narrow = [](auto number) { return static_cast<unsigned short>(number); };
    return {narrow(calendar.tm_year + 1900),
            narrow(calendar.tm_mon + 1),
            narrow(calendar.tm_mday),
            narrow(calendar.tm_hour),
            narrow(calendar.tm_min),
            narrow(calendar.tm_sec),
            narrow((milliseconds - seconds).count()),
            static_cast<short>(calendar.tm_gmtoff / secondsPerHour)};
}

} // namespace Orv::Agent
