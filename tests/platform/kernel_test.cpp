/**
 * @file
 * The platform provider over kernels instead of descriptions.
 */
#include "tests/platform/PlatformProvider.h"
#include "tests/support/Namespace.h"

namespace marlo::test {
namespace {

/** Keeps a configuration of the machine that runs the tests out of them. */
class PlatformOverKernel : public testing::Test {
  protected:
    PlatformOverKernel() { setenv("ORV_AGENT_BACKEND", "linux", 1); }

    ~PlatformOverKernel() override { unsetenv("ORV_AGENT_BACKEND"); }

    PlatformOverKernel(const PlatformOverKernel&) = delete;
    PlatformOverKernel& operator=(const PlatformOverKernel&) = delete;

    static Answer portsOf(const Orv::Test::Namespace& space) {
        Answer answer;
        space.run([&] { answer = PlatformProvider("TAVIS_NetworkPort").instances(); });
        return answer;
    }
};

TEST_F(PlatformOverKernel, VirtualInterfacesHaveAPortAndNoCard) {
    REQUIRE_NAMESPACES();
    const Orv::Test::Namespace space;
    space.ip("link add v0 type veth peer name v1");
    const Answer ports = portsOf(space);
    ASSERT_EQ(ports.code, CMPI_RC_OK) << ports.message;
    ASSERT_EQ(ports.instances.size(), 2U);
    const Instance* port = findInstance(ports, "DeviceID", "v0");
    ASSERT_NE(port, nullptr);
    EXPECT_EQ(textOf(*port, "Status"), "Stopped");
    EXPECT_EQ(findName(port->properties, "Speed")->value, Value::uint(CMPI_uint64, 10'000'000'000U));
    EXPECT_EQ(findName(port->properties, "LinkTechnology")->value, Value::uint(CMPI_uint16, 2));
    EXPECT_EQ(findName(port->properties, "PermanentAddress")->value, Value::null(CMPI_string));
    space.run([] {
        const Answer cards = PlatformProvider("TAVIS_NetworkCard").instances();
        EXPECT_EQ(cards.code, CMPI_RC_OK);
        EXPECT_TRUE(cards.done);
        EXPECT_TRUE(cards.instances.empty());
    });
}

TEST_F(PlatformOverKernel, BadBytesInOnePropertyDoNotSpoilTheAnswer) {
    REQUIRE_NAMESPACES();
    const Orv::Test::Namespace space;
    space.ip("link add 'bad\xff' type veth peer name good");
    space.ip("link set good alias 'a\xc3(\x1b[31m'");
    const Answer ports = portsOf(space);
    ASSERT_EQ(ports.instances.size(), 2U);
    EXPECT_NE(findInstance(ports, "DeviceID", "bad\xef\xbf\xbd"), nullptr);
    const Instance* good = findInstance(ports, "DeviceID", "good");
    ASSERT_NE(good, nullptr);
    EXPECT_EQ(textOf(*good, "Description"), "a\xef\xbf\xbd( [31m");
}

TEST_F(PlatformOverKernel, PortsOfThisHostAreFoundByTheirNames) {
    const PlatformProvider provider("TAVIS_NetworkPort");
    for (const auto& path : provider.names().paths) {
        const Answer answer = provider.get(path);
        EXPECT_EQ(answer.code, CMPI_RC_OK) << path.toString() << ' ' << answer.message;
    }
}

TEST_F(PlatformOverKernel, EachCardOfThisHostIsNamedAfterAPort) {
    const Answer ports = PlatformProvider("TAVIS_NetworkPort").instances();
    const Answer cards = PlatformProvider("TAVIS_NetworkCard").instances();
    EXPECT_EQ(cards.code, CMPI_RC_OK) << cards.message;
    for (const auto& card : cards.instances) {
        const auto tag = textOf(card, "Tag");
        ASSERT_TRUE(tag);
        EXPECT_NE(findInstance(ports, "DeviceID", *tag), nullptr) << *tag;
    }
}

} // namespace
} // namespace marlo::test
