#include "tests/cli/Marlo.h"

#include "tests/cli/fixtures/FixtureClasses.h"
#include "tests/support/Adapters.h"

#include <array>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <stdexcept>

#include <fcntl.h>
#include <poll.h>
#include <sys/wait.h>
#include <unistd.h>

namespace marlo::test {

namespace {

const std::string FourAdapters = std::string(R"([host]
description = "lab"

[[adapter]]
identity = "bond0"
device = "Bonding driver"
)") + uplinkProperties + R"([[adapter]]
identity = "eth0"
device = "Card"
status = 1
dhcp = 1
ip_support = 1
ipv4_address = "198.51.100.23"
ipv4_subnet_mask = "255.255.254.0"
default_gateway = "198.51.100.1"
dns_servers = ["198.51.100.2"]
mac_address = "02:00:5e:10:00:02"

[[adapter]]
identity = "eth1"
device = "Card"
status = 12
dhcp = 3
ip_support = 1
ipv4_address = "203.0.113.7"
ipv4_subnet_mask = "255.255.255.128"
mac_address = "02:00:5e:10:00:03"

[[adapter]]
identity = "eth2"
device = "Card"
status = 5
dhcp = 3
mac_address = "02:00:5e:10:00:04"
)";

const std::string FixtureMof =
    std::string("Qualifier Key : boolean = false, Scope(property, reference), Flavor(DisableOverride);") +
    fixtureClasses + R"(
class TEST_Unserved { [Key] string Id; };
class TEST_Elsewhere { [Key] string Id; };
)";

/** A file descriptor that is closed when it goes. */
class Descriptor {
  public:
    Descriptor() = default;

    explicit Descriptor(int fd) : _fd(fd) {}

    ~Descriptor() { close(); }

    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    void reset(int fd) {
        close();
        _fd = fd;
    }

    void close() {
        if (_fd >= 0) {
            ::close(_fd);
        }
        _fd = -1;
    }

    [[nodiscard]] int get() const { return _fd; }

  private:
    int _fd = -1;
};

void openPipe(Descriptor& reader, Descriptor& writer) {
    std::array<int, 2> ends{};
    if (pipe2(ends.data(), O_CLOEXEC) != 0) {
        throw std::runtime_error("pipe2 failed");
    }
    reader.reset(ends[0]);
    writer.reset(ends[1]);
}

[[noreturn]] void becomeProgram(const std::vector<std::string>& arguments,
                                const std::vector<std::string>& environment, int out, int err,
                                const std::string& directory) {
    constexpr int CannotStart = 127;
    for (const std::string& variable : environment) {
        putenv(const_cast<char*>(variable.c_str()));
    }
    std::vector<char*> argv;
    for (const std::string& argument : arguments) {
        argv.push_back(const_cast<char*>(argument.c_str()));
    }
    argv.push_back(nullptr);
    if (dup2(out, STDOUT_FILENO) < 0 || dup2(err, STDERR_FILENO) < 0 ||
        (!directory.empty() && chdir(directory.c_str()) != 0)) {
        _exit(CannotStart);
    }
    execvp(argv[0], argv.data());
    _exit(CannotStart);
}

/** Reads both pipes until both are closed. */
void collect(Descriptor& out, Descriptor& err, Outcome& outcome) {
    std::array<pollfd, 2> polled = {{{out.get(), POLLIN, 0}, {err.get(), POLLIN, 0}}};
    std::array<std::string*, 2> texts = {&outcome.out, &outcome.err};
    std::array<char, 65536> buffer{};
    while (polled[0].fd >= 0 || polled[1].fd >= 0) {
        poll(polled.data(), polled.size(), -1);
        for (std::size_t i = 0; i < polled.size(); ++i) {
            if (polled[i].fd < 0 || polled[i].revents == 0) {
                continue;
            }
            const ssize_t count = read(polled[i].fd, buffer.data(), buffer.size());
            if (count <= 0) {
                polled[i].fd = -1;
            } else {
                texts[i]->append(buffer.data(), static_cast<std::size_t>(count));
            }
        }
    }
}

} // namespace

Outcome runProgram(const std::vector<std::string>& arguments, const std::vector<std::string>& environment,
                   const std::string& outputFile, const std::string& directory) {
    Descriptor outReader;
    Descriptor outWriter;
    Descriptor errReader;
    Descriptor errWriter;
    openPipe(outReader, outWriter);
    openPipe(errReader, errWriter);
    if (!outputFile.empty()) {
        outWriter.reset(open(outputFile.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600));
    }
    const pid_t child = fork();
    if (child == 0) {
        becomeProgram(arguments, environment, outWriter.get(), errWriter.get(), directory);
    }
    outWriter.close();
    errWriter.close();
    Outcome outcome;
    collect(outReader, errReader, outcome);
    int status = 0;
    if (waitpid(child, &status, 0) == child) {
        constexpr int SignalBase = 128;
        outcome.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : SignalBase + WTERMSIG(status);
    }
    return outcome;
}

MarloTest::MarloTest() : _tree(write("host.toml", FourAdapters)) {}

std::string MarloTest::write(const std::string& name, const std::string& text) const {
    const std::string file = path(name);
    std::filesystem::create_directories(std::filesystem::path(file).parent_path());
    std::ofstream(file) << text;
    return file;
}

Outcome MarloTest::marlo(std::vector<std::string> arguments) const {
    arguments.insert(arguments.begin(), MARLO_EXECUTABLE);
    return runProgram(arguments, {"ORV_AGENT_TREE=" + _tree}, "", directory());
}

nlohmann::ordered_json MarloTest::marloJson(std::vector<std::string> arguments) const {
    arguments.emplace_back("--json");
    const Outcome outcome = marlo(std::move(arguments));
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    EXPECT_EQ(outcome.err, "");
    auto json = nlohmann::ordered_json::parse(outcome.out, nullptr, false);
    EXPECT_TRUE(json.is_array()) << outcome.out;
    return json;
}

FixtureTest::FixtureTest() {
    write("schema/test.mof", FixtureMof);
    std::filesystem::create_directories(path("providers"));
    std::filesystem::create_directories(path("libraries"));
    std::filesystem::create_symlink(MARLO_FIXTURE_PROVIDER, path("libraries/libFixture.so"));
    registerProvider("fixture.toml", "libFixture.so", "FixtureProvider",
                     {"TEST_Typed", "TEST_Throwing", "TEST_Refusing", "TEST_Partial", "TEST_Empty"});
}

void FixtureTest::registerProvider(const std::string& file, const std::string& library, const std::string& provider,
                                   const std::vector<std::string>& classes) const {
    std::string list;
    for (const std::string& name : classes) {
        list += (list.empty() ? "\"" : ", \"") + name + '"';
    }
    write("providers/" + file, "library = \"" + library + "\"\n[[provider]]\nname = \"" + provider +
                                   "\"\nkinds = [\"instance\"]\nnamespaces = [\"root/test\"]\nclasses = [" + list +
                                   "]\n");
}

std::vector<std::string> FixtureTest::onFixture(std::vector<std::string> arguments) const {
    for (const char* name : {"schema", "providers", "libraries"}) {
        arguments.push_back(std::string("--") + name);
        arguments.push_back(path(name));
    }
    arguments.insert(arguments.end(), {"-n", "root/test"});
    return arguments;
}

} // namespace marlo::test
