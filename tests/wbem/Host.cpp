#include "tests/wbem/Host.h"

#include <cstdlib>
#include <fstream>
#include <stdexcept>

#include <gtest/gtest.h>

namespace marlo::test {

namespace {

constexpr const char* tree = R"([host]
description = "lab"

[[adapter]]
identity = "usb0"
chassis = "BMC"
dhcp = 3
ipv4_address = "198.51.100.2"
ipv4_subnet_mask = "255.255.255.0"

[[adapter]]
identity = "eth0"
description = "Uplink"
device = "Card"
status = 1
dhcp = 3
ip_support = 3
ipv4_address = "192.0.2.10"
ipv4_subnet_mask = "255.255.255.0"
ipv6_address = "2001:db8:0:2::10"
default_gateway = "192.0.2.1"
dns_servers = ["192.0.2.53", "2001:db8:0:2::53"]
dns_suffixes = ["lab.example.org", "example.org"]
dns_hostname = "lab"
dns_domain = "lab.example.org"
mac_address = "02:00:5e:10:00:01"

[[adapter]]
identity = "eth1"
device = "Card"
status = 12
dhcp = 1
ipv4_address = "203.0.113.10"
ipv4_subnet_mask = "255.255.255.0"
mac_address = "02:00:5e:10:00:02"
)";

constexpr const char* fixtureMof = R"(
#pragma namespace ("root/test")
class TEST_Base { [Key] string Id; string Text; };
class TEST_Typed : TEST_Base {
    string Nothing; string Texts[]; uint8 Unsigned8; uint64 Unsigned64; sint64 Signed64; real64 Real; boolean Truth;
    char16 Character; datetime When; TEST_Typed REF Other;
};
class TEST_Throwing { [Key] string Id; };
class TEST_Refusing { [Key] string Id; };
class TEST_Partial { [Key] string Id; };
class TEST_Empty { [Key] string Id; uint32 Grow(); };
)";

std::filesystem::path makeDirectory() {
    std::string pattern = (std::filesystem::temp_directory_path() / "marlo-wbem-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) {
        throw std::runtime_error("cannot make a directory like " + pattern);
    }
    return pattern;
}

void write(const std::filesystem::path& file, const std::string& text) {
    std::filesystem::create_directories(file.parent_path());
    std::ofstream(file) << text;
}

std::string backwards(const std::string& text) {
    return {text.rbegin(), text.rend()};
}

/** The agent of a process reads one description, from the same place for all hosts that there are in turn. */
const std::filesystem::path& treeFile() {
    static const std::filesystem::path directory = makeDirectory();
    static const std::filesystem::path file = directory / "host.toml";
    return file;
}

class RemoveTree : public testing::Environment {
  public:
    void TearDown() override {
        std::error_code ignored;
        std::filesystem::remove_all(treeFile().parent_path(), ignored);
    }
};

const auto* const removal = testing::AddGlobalTestEnvironment(new RemoveTree); // NOLINT(cert-err58-cpp)

class BackwardsCheck final : public security::PasswordCheck {
  public:
    [[nodiscard]] bool isGood(const std::string& user, const std::string& password) override {
        return password == backwards(user);
    }
};

security::GatekeeperOptions gatekeeperOptions() {
    security::GatekeeperOptions options;
    options.access.read = {Host::reader};
    options.access.change = {Host::changer};
    options.access.subscribe = {Host::subscriber};
    options.trialUser = Host::everything;
    options.trialPassword = backwards(Host::everything);
    options.accounts = std::make_shared<BackwardsCheck>();
    options.failureDelay = std::chrono::milliseconds(0);
    return options;
}

std::string base64(const std::string& text) {
    constexpr std::string_view digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string encoded;
    for (std::size_t i = 0; i < text.size(); i += 3) {
        std::uint32_t group = 0;
        for (std::size_t k = 0; k < 3; ++k) {
            group = (group << 8U) | (i + k < text.size() ? static_cast<unsigned char>(text[i + k]) : 0U);
        }
        for (std::size_t k = 0; k < 4; ++k) {
            encoded += i + k > text.size() ? '=' : digits[(group >> (18 - 6 * k)) & 0x3FU];
        }
    }
    return encoded;
}

} // namespace

Host::Host(const wbem::Limits& limits, std::vector<wbem::Route> routes) : _directory(makeDirectory()) {
    write(treeFile(), tree);
    setenv("ORV_AGENT_BACKEND", "file", 1);
    setenv("ORV_AGENT_TREE", treeFile().c_str(), 1);
    write(_directory / "schema/test.mof", std::string(fixtureMof) + itemsMof);
    write(_directory / "providers/fixture.toml",
          "library = \"" MARLO_FIXTURE_PROVIDER
          "\"\n[[provider]]\nname = \"FixtureProvider\"\nkinds = [\"instance\"]\n"
          "namespaces = [\"root/test\"]\nclasses = [\"TEST_Typed\", \"TEST_Throwing\", \"TEST_Refusing\", "
          "\"TEST_Partial\", \"TEST_Empty\"]\n");
    ObjectManagerOptions options;
    options.schemaDirectories = {MARLO_SHARE "/schema", (_directory / "schema").string()};
    options.providerDirectories = {MARLO_SHARE "/providers", (_directory / "providers").string()};
    options.libraryDirectory = MARLO_LIBRARIES;
    options.log = [](const std::string& /*line*/) {};
    _manager = std::make_unique<ObjectManager>(options);
    _manager->add(_items);
    _gatekeeper = std::make_unique<security::Gatekeeper>(gatekeeperOptions(), [](const std::string& /*line*/) {});
    wbem::ServiceOptions service;
    service.admit = [this](const http::RequestHead& head, const http::Peer& peer) {
        return _gatekeeper->admit(head, peer);
    };
    service.host = "host.example";
    service.limits = limits;
    service.routes = std::move(routes);
    service.log = [this](const wbem::Record& record) {
        const std::lock_guard lock(_mutex);
        _records.push_back(record);
    };
    _service = std::make_unique<wbem::Service>(*_manager, std::move(service));
}

Host::~Host() {
    _service.reset();
    _manager.reset();
    std::error_code ignored;
    std::filesystem::remove_all(_directory, ignored);
}

std::vector<wbem::Record> Host::records() const {
    const std::lock_guard lock(_mutex);
    return _records;
}

std::string Host::credentials(const std::string& user) {
    return "Basic " + base64(user + ":" + backwards(user));
}

} // namespace marlo::test
