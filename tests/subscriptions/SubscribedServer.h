/**
 * @file
 * The built server with the torrent of indications, a listener, and the commands about subscriptions.
 */
#pragma once

#include "tests/delivery/Listener.h"
#include "tests/server/Served.h"

#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <gmock/gmock.h>

namespace marlo::test {

class SubscribedServer : public ServedTest {
  protected:
    SubscribedServer() {
        configure("directories",
                  "schema = [\"" MARLO_SITE "/schema\"]\nproviders = [\"" MARLO_SITE "/providers\"]\n");
        setVariable("TORRENT_LEDGER", path("ledger"));
        setVariable("TORRENT_COUNT", "0");
        setVariable("ORV_AGENT_CONTROL", path("control"));
    }

    /** marlo with these arguments and the server's socket. */
    [[nodiscard]] Outcome command(std::vector<std::string> arguments) const {
        arguments.insert(arguments.begin(), MARLO_EXECUTABLE);
        arguments.insert(arguments.end(), {"--socket", socket()});
        return runProgram(arguments);
    }

    nlohmann::json json(std::vector<std::string> arguments) const {
        arguments.emplace_back("--json");
        const Outcome outcome = command(std::move(arguments));
        EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
        return outcome.exitCode == 0 ? nlohmann::json::parse(outcome.out) : nlohmann::json();
    }

    /** Plays events; needs a subscription, so that somebody reads the pipe. */
    void play(const std::string& lines) const {
        const auto end = std::chrono::steady_clock::now() + Patience;
        while (!std::filesystem::is_fifo(path("control")) && std::chrono::steady_clock::now() < end) {
            std::this_thread::sleep_for(std::chrono::milliseconds(5));
        }
        std::ofstream(path("control")) << lines;
    }

    std::string printed(const std::vector<std::string>& arguments) const {
        const Outcome outcome = wbemcli(arguments);
        EXPECT_EQ(outcome.exitCode, 0) << testing::PrintToString(arguments) << outcome.err;
        return outcome.out;
    }

    [[nodiscard]] std::string interop(const std::string& rest) const { return url("http", "root/interop:" + rest); }

    static std::string keys(const std::string& className, const std::string& name) {
        return "SystemCreationClassName=\"CIM_ComputerSystem\",SystemName=\"here\",CreationClassName=\"" + className +
               "\",Name=\"" + name + "\"";
    }

    /** The path of an object as a reference: wbemcli takes it without quotes of its own. */
    static std::string reference(const std::string& host, const std::string& className, const std::string& name) {
        return host + "/root/interop:" + className + "." + keys(className, name);
    }

    void kill() {
        server().signal(SIGKILL);
        ASSERT_EQ(server().wait(Patience), 128 + SIGKILL);
    }

    /** How many numbers the torrent wrote down as taken. */
    [[nodiscard]] std::size_t taken() const {
        std::error_code none;
        const auto size = std::filesystem::file_size(path("ledger"), none);
        return none ? 0 : size / 4;
    }

    delivery::Listener listener;
};

} // namespace marlo::test
