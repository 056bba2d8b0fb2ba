#include "tests/wbem/Host.h"

#include "tests/cli/fixtures/FixtureClasses.h"
#include "tests/support/Adapters.h"
#include "tests/support/DescribedHost.h"

#include <filesystem>
#include <fstream>

#include <gtest/gtest.h>

namespace marlo::test {

namespace {

const std::string description = std::string(R"([host]
description = "lab"

)") + controllerAdapter + R"([[adapter]]
identity = "eth0"
device = "Card"
)" + uplinkProperties + R"([[adapter]]
identity = "eth1"
device = "Card"
status = 12
dhcp = 1
ipv4_address = "203.0.113.10"
ipv4_subnet_mask = "255.255.255.0"
mac_address = "02:00:5e:10:00:02"
)";

void write(const std::filesystem::path& file, const std::string& text) {
    std::filesystem::create_directories(file.parent_path());
    std::ofstream(file) << text;
}

std::string backwards(const std::string& text) {
    return {text.rbegin(), text.rend()};
}

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

Host::Host(const wbem::Limits& limits, std::vector<wbem::Route> routes) {
    describeHost(description);
    write(_directory.path() / "schema/test.mof", std::string(fixtureClasses) + itemsMof);
    write(_directory.path() / "providers/fixture.toml",
          "library = \"" MARLO_FIXTURE_PROVIDER
          "\"\n[[provider]]\nname = \"FixtureProvider\"\nkinds = [\"instance\"]\n"
          "namespaces = [\"root/test\"]\nclasses = [\"TEST_Typed\", \"TEST_Throwing\", \"TEST_Refusing\", "
          "\"TEST_Partial\", \"TEST_Empty\"]\n");
    ObjectManagerOptions options;
    options.schemaDirectories = {MARLO_SHARE "/schema", _directory.file("schema")};
    options.providerDirectories = {MARLO_SHARE "/providers", _directory.file("providers")};
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
}

std::vector<wbem::Record> Host::records() const {
    const std::lock_guard lock(_mutex);
    return _records;
}

std::string Host::credentials(const std::string& user) {
    return "Basic " + base64(user + ":" + backwards(user));
}

} // namespace marlo::test
