#include "agent/library/BackEndHolder.h"

#include "agent/config/Configuration.h"
#include "agent/file/FileBackEnd.h"
#include "agent/library/Log.h"
#include "agent/library/PerProcess.h"
#include "agent/linux/LinuxBackEnd.h"

#include <memory>
#include <utility>

#include <pthread.h>

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
    static PerProcess<BackEnd> backEnd;
    static const int registered =
        ::pthread_atfork([] { backEnd.beforeFork(); }, [] { backEnd.inParent(); }, [] { backEnd.inChild(); });
    static_cast<void>(registered); // without memory for it, forked processes share their parent's back end
    return backEnd.get([] {
        const Configuration configuration = loadConfiguration();
        Log::instance().configure(configuration);
        return makeBackEnd(configuration);
    });
}

void reportFailure(const char* function, const char* text) noexcept {
    Log::instance().log({function, "agent/library/BackEndHolder.cpp", __LINE__, "Hearth.Agent", 6000, text});
}

} // namespace Orv::Agent
