#include "tests/platform/PlatformProvider.h"

#include <array>
#include <cstdio>
#include <memory>
#include <set>

#include <dlfcn.h>

namespace marlo::test {
namespace {

std::string outputOf(const std::string& command) {
    const std::unique_ptr<FILE, int (*)(FILE*)> pipe(popen(command.c_str(), "r"), pclose);
    std::string output;
    std::array<char, 4096> buffer{};
    while (pipe && fgets(buffer.data(), buffer.size(), pipe.get()) != nullptr) {
        output += buffer.data();
    }
    return output;
}

TEST(PlatformLibrary, ExportsItsFactoriesAndNothingElse) {
    EXPECT_EQ(outputOf("nm -D --defined-only --format=posix " PLATFORM_LIBRARY " | cut -d' ' -f1 | sort"),
              "TavisNetworkCardProvider_Create_InstanceMI\nTavisNetworkPortProvider_Create_InstanceMI\n");
}

TEST(PlatformLibrary, NeedsNoOtherLibraryOfThisSystem) {
    const std::string needed = outputOf("readelf -d " PLATFORM_LIBRARY " | grep NEEDED");
    EXPECT_NE(needed.find("libmnl"), std::string::npos);
    EXPECT_EQ(needed.find("Orv"), std::string::npos) << needed;
    EXPECT_EQ(needed.find("Marlo"), std::string::npos) << needed;
}

TEST(PlatformLibrary, StaysMappedOnceLoaded) {
    void* library = dlopen(PLATFORM_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(library, nullptr) << dlerror();
    dlclose(library);
    EXPECT_NE(dlopen(PLATFORM_LIBRARY, RTLD_NOW | RTLD_NOLOAD), nullptr);
}

class PlatformTable : public testing::TestWithParam<std::pair<const char*, const char*>> {
  protected:
    PlatformProvider provider{GetParam().first};
    CMPIInstanceMI* mi = provider.mi();
};

INSTANTIATE_TEST_SUITE_P(Classes, PlatformTable,
                         testing::Values(std::pair("TAVIS_NetworkCard", "TavisNetworkCardProvider"),
                                         std::pair("TAVIS_NetworkPort", "TavisNetworkPortProvider")),
                         [](const auto& tested) { return std::string(tested.param.first); });

TEST_P(PlatformTable, IsOfVersion2AndNamed) {
    EXPECT_EQ(mi->ft->ftVersion, 200);
    EXPECT_EQ(mi->ft->miVersion, 200);
    EXPECT_STREQ(mi->ft->miName, GetParam().second);
}

TEST_P(PlatformTable, SupportsReadingOnly) {
    const broker::CallScope scope;
    EXPECT_EQ(mi->ft->createInstance(mi, nullptr, nullptr, nullptr, nullptr).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(mi->ft->modifyInstance(mi, nullptr, nullptr, nullptr, nullptr, nullptr).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(mi->ft->deleteInstance(mi, nullptr, nullptr, nullptr).rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(mi->ft->execQuery(mi, nullptr, nullptr, nullptr, "select * from x", "WQL").rc,
              CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_P(PlatformTable, IsUsableAgainAfterCleanup) {
    const DescribedHost host("[[card]]\nname = \"eth0\"\n[[port]]\nidentity = \"eth0\"\n");
    EXPECT_EQ(mi->ft->cleanup(mi, nullptr, 0).rc, CMPI_RC_OK);
    const PlatformProvider again(GetParam().first);
    EXPECT_EQ(again.names().paths.size(), 1U);
}

} // namespace
} // namespace marlo::test
