#include "host/cli/Commands.h"
#include "host/cli/Environment.h"
#include "host/cli/Options.h"
#include "host/cli/Output.h"
#include "host/cli/Serve.h"
#include "host/cli/Status.h"
#include "host/cli/Subscribe.h"

#include <exception>

using namespace marlo::cli;

namespace {

ExitCode runCommandLine(int argc, const char* const* argv) {
    Output output;
    const CommandLine line = readCommandLine(argc, argv);
    if (line.answer) {
        output.write(*line.answer);
        output.finish();
        return Answered;
    }
    if (line.options.command == Command::Status) {
        return runStatus(line.options, output);
    }
    if (isAboutSubscriptions(line.options.command)) {
        return runSubscriptions(line.options, output);
    }
    tellAgent(line.options.agent);
    if (line.options.command == Command::Serve) {
        return runServe(line.options, output);
    }
    marlo::ObjectManager manager(findDirectories(line.options.directories));
    return run(manager, line.options, output);
}

} // namespace

int main(int argc, char** argv) {
    try {
        return runCommandLine(argc, argv);
    } catch (const UsageError& error) {
        complain(error.what());
        complain("try marlo --help");
        return WrongUsage;
    } catch (const OutputError& error) {
        if (!error.readerIsGone()) {
            complain(error.what());
        }
    } catch (const std::exception& error) {
        complain(error.what());
    }
    return Failed;
}
