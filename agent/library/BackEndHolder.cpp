#include "agent/library/BackEndHolder.h"

#include "agent/config/Configuration.h"
#include "agent/file/FileBackEnd.h"
#include "agent/library/Log.h"
#include "agent/linux/LinuxBackEnd.h"

#include <atomic>
#include <mutex>
#include <utility>

namespace Orv::Agent {

namespace {

std::unique_ptr<BackEnd> makeBackEnd(const Configuration& configuration) {
    if (configuration.backEnd == Configuration::BackEndKind::File) {
        return makeFileBackEnd(configuration.treeFile, configuration.control);
    }
    Persistence::Environment host;
    host.choice = configuration.persistence;
    host.report = [](const std::string& line) { reportFailure("setProperty", line.c_str()); };
    return Linux::makeLinuxBackEnd({}, std::move(host));
}

} // namespace

BackEnd& processBackEnd() {
    static std::mutex mutex;
    static std::atomic<BackEnd*> backEnd{nullptr};
    if (BackEnd* present = backEnd.load(std::memory_order_acquire)) {
        return *present;
    }
    const std::lock_guard lock(mutex);
    if (BackEnd* present = backEnd.load(std::memory_order_acquire)) {
        return *present;
    }
    const Configuration configuration = loadConfiguration();
    Log::instance().configure(configuration);
    BackEnd* made = makeBackEnd(configuration).release();
    backEnd.store(made, std::memory_order_release);
    return *made;
}

void reportFailure(const char* function, const char* text) noexcept {
    Log::instance().log({function, "agent/library/BackEndHolder.cpp", __LINE__, "Hearth.Agent", 6000, text});
}

} // namespace Orv::Agent
