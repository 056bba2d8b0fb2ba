#include "agent/linux/Resolver.h"
#include "agent/persistence/ResolvConf.h"
#include "tests/persistence/Plans.h"

#include <filesystem>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using namespace Orv::Test;
using testing::HasSubstr;

using Texts = std::vector<std::string>;

NameSettings servers(Texts list) {
    return {{}, std::move(list), {}};
}

NameSettings suffixes(Texts list) {
    return {{}, {}, std::move(list)};
}

NameSettings domain(const std::string& name) {
    return {name, {}, {}};
}

struct Case {
    const char* before;
    NameSettings wanted;
    const char* after;
};

TEST(EditResolvConf, ChangesTheSettingsAndNothingElse) {
    const Case cases[] = {
        {"", servers({"192.0.2.53", "2001:db8::53"}), "nameserver 192.0.2.53\nnameserver 2001:db8::53\n"},
        {"# c\noptions edns0 # o\n; d\nsortlist 10.0.0.0\nunknown x\n", servers({"192.0.2.53"}),
         "# c\noptions edns0 # o\n; d\nsortlist 10.0.0.0\nunknown x\nnameserver 192.0.2.53\n"},
        {"nameserver 10.0.0.1 # first\n# between\nnameserver\t10.0.0.2\noptions x\n",
         servers({"10.0.0.9", "10.0.0.8"}),
         "nameserver 10.0.0.9 # first\n# between\nnameserver\t10.0.0.8\noptions x\n"},
        {"nameserver 10.0.0.1\noptions x\n", servers({"10.0.0.1", "10.0.0.2", "10.0.0.3"}),
         "nameserver 10.0.0.1\nnameserver 10.0.0.2\nnameserver 10.0.0.3\noptions x\n"},
        {"nameserver 10.0.0.1\nnameserver 10.0.0.2\nnameserver 10.0.0.3\n# end\n", servers({"10.0.0.2"}),
         "nameserver 10.0.0.2\n# end\n"},
        {"nameserver 10.0.0.1\nsearch a\n", servers({}), "search a\n"},
        {"nameserver 10.0.0.1", servers({"10.0.0.1", "10.0.0.2"}), "nameserver 10.0.0.1\nnameserver 10.0.0.2"},
        {" nameserver 10.0.0.1\nnameserver\n", servers({"10.0.0.2"}),
         " nameserver 10.0.0.1\nnameserver\nnameserver 10.0.0.2\n"},
        {"nameserver 10.0.0.1\r\n", servers({"10.0.0.2"}), "nameserver 10.0.0.2\r\n"},
        {"search a b # c\nnameserver 10.0.0.1\n", suffixes({"x.org", "y.org"}),
         "search x.org y.org\nnameserver 10.0.0.1\n"},
        {"search a\nsearch b\n", suffixes({"x.org"}), "search x.org\n"},
        {"search a\n", suffixes({"a"}), "search a\n"},
        {"search a\nnameserver 10.0.0.1\n", suffixes({}), "nameserver 10.0.0.1\n"},
        {"domain d\nnameserver 10.0.0.1\n", suffixes({"x.org"}), "domain d\nnameserver 10.0.0.1\nsearch x.org\n"},
        {"search a\ndomain d\n", suffixes({"x.org"}), "domain d\nsearch x.org\n"},
        {"domain d\n", domain("x.org"), "domain x.org\n"},
        {"", domain("x.org"), "domain x.org\n"},
        {"# c\nsearch a b\nnameserver 10.0.0.1\n", domain("x.org"),
         "# c\ndomain x.org\nsearch a b\nnameserver 10.0.0.1\n"},
        {"search a b\ndomain d\n", domain("x.org"), "domain x.org\n"},
        {"domain d # c\n", domain("x.org"), "domain x.org # c\n"},
        {"search a\n",
         {"x.org", Texts{"10.0.0.1"}, Texts{"y.org"}},
         "domain x.org\nsearch y.org\nnameserver 10.0.0.1\n"},
        {"nameserver 10.0.0.1\nsearch a\nsearch b",
         {{}, Texts{"10.0.0.1", "10.0.0.2"}, Texts{"x.org"}},
         "nameserver 10.0.0.1\nnameserver 10.0.0.2\nsearch x.org"},
        {"", {}, ""},
        {"search a\ndomain b\nsearch c", {}, "search a\ndomain b\nsearch c"},
    };
    for (const auto& [before, wanted, after] : cases) {
        EXPECT_EQ(editResolvConf(before, wanted), after) << before;
        EXPECT_EQ(editResolvConf(after, wanted), after) << "a second time: " << before;
    }
}

TEST(EditResolvConf, IsReadBackAsItWasWanted) {
    const std::string befores[] = {"", "search a\ndomain b\n", "domain b\nsearch a",
                                   "# c\n\n\nsearch a\nsearch b\ndomain c\nsearch d",
                                   "nameserver 1.1.1.1\nsearch\tz  y\nnameserver ::1\n"};
    for (const std::string& before : befores) {
        const NameSettings wanted{"x.org", Texts{"10.0.0.1", "2001:db8::1"}, Texts{"y.org", "z.org"}};
        const auto read = Linux::parseResolvConf(editResolvConf(before, wanted));
        EXPECT_EQ(read.domain, "x.org") << before;
        EXPECT_EQ(read.servers, (Texts{"10.0.0.1", "2001:db8::1"})) << before;
        EXPECT_EQ(read.suffixes, (Texts{"y.org", "z.org"})) << before;
    }
}

TEST(ResolvConf, PlansTheFileOfTheHost) {
    const TemporaryHost host;
    host.write("/etc/resolv.conf", "# c\n");
    const ResolvConf service(environmentAt(host.root()));
    const FileEdits expected{{host.at("/etc/resolv.conf"), "# c\n", "# c\nnameserver 10.0.0.1\n"}};
    EXPECT_EQ(service.plan(servers({"10.0.0.1"})), expected);
    EXPECT_EQ(service.plan(servers({})), FileEdits{});
    EXPECT_EQ(service.plan({}), FileEdits{});
}

TEST(ResolvConf, PlansAFileThatIsNotThereYet) {
    const TemporaryHost host;
    const FileEdits expected{{host.at("/etc/resolv.conf"), std::nullopt, "nameserver 10.0.0.1\n"}};
    EXPECT_EQ(ResolvConf(environmentAt(host.root())).plan(servers({"10.0.0.1"})), expected);
}

TEST(ResolvConf, RefusesAFileThatAnotherProgramMakes) {
    const TemporaryHost host;
    host.write("/run/NetworkManager/resolv.conf", "nameserver 10.0.0.1\n");
    std::filesystem::create_directories(host.at("/etc"));
    std::filesystem::create_symlink("../run/NetworkManager/resolv.conf", host.at("/etc/resolv.conf"));
    EXPECT_THAT(messageOf([&] { (void)ResolvConf(environmentAt(host.root())).plan(servers({"10.0.0.2"})); }),
                HasSubstr("which another program writes"));
}

} // namespace
