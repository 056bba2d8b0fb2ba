#include "tests/support/Namespace.h"

#include <fstream>
#include <iterator>
#include <stdexcept>

#include <net/if.h>

namespace Orv::Test {
namespace {

std::string contentOf(const std::string& path) {
    std::ifstream file(path);
    return {std::istreambuf_iterator<char>(file), {}};
}

TEST(Namespace, holdsItsOwnInterfacesAndNoOthers) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    space.ip("link add inside0 type veth peer name inside1");
    unsigned index = 0;
    space.run([&] { index = if_nametoindex("inside0"); });
    EXPECT_NE(index, 0U);
    EXPECT_EQ(if_nametoindex("inside0"), 0U);
    EXPECT_NE(space.shell("ls /sys/class/net").find("inside0"), std::string::npos);
}

TEST(Namespace, passesOnWhatTheWorkThrows) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    EXPECT_THROW(space.run([] { throw std::out_of_range("thrown inside"); }), std::out_of_range);
}

TEST(Namespace, tellsWhyACommandFailed) {
    REQUIRE_NAMESPACES();
    const Namespace space;
    try {
        space.ip("link show absent0");
        FAIL() << "the command does not fail";
    } catch (const std::runtime_error& error) {
        EXPECT_NE(std::string(error.what()).find("absent0"), std::string::npos) << error.what();
    }
}

TEST(Namespace, replacesAFileInsideOnly) {
    REQUIRE_NAMESPACES();
    const std::string outside = contentOf("/etc/passwd");
    Namespace space;
    space.replaceFile("/etc/passwd", "192.0.2.1 first\n");
    EXPECT_EQ(space.shell("cat /etc/passwd"), "192.0.2.1 first\n");
    space.replaceFile("/etc/passwd", "192.0.2.2 second\n");
    EXPECT_EQ(space.shell("cat /etc/passwd"), "192.0.2.2 second\n");
    EXPECT_EQ(contentOf("/etc/passwd"), outside);
}

TEST(Namespace, takesAnInterfaceFromAnother) {
    REQUIRE_NAMESPACES();
    const Namespace here;
    const Namespace there;
    here.ip("link add moved0 type veth peer name moved1");
    here.ip("link set moved0 netns " + there.descriptorPath());
    EXPECT_NE(there.ip("-br link").find("moved0"), std::string::npos);
    EXPECT_EQ(here.ip("-br link").find("moved0@"), std::string::npos);
}

} // namespace
} // namespace Orv::Test
