#include "tests/security/Shell.h"
#include "tests/support/Require.h"

#include <string>

#include <gtest/gtest.h>

namespace {

using marlo::test::shell;

class ServiceUnit : public testing::Test {
  protected:
    void SetUp() override {
        const std::string version = shell("systemd-analyze --version");
        GO_ON_UNLESS(version.starts_with("systemd ") ? "" : "systemd-analyze is not installed: " + version);
    }
};

TEST_F(ServiceUnit, IsUnderstoodBySystemd) {
    EXPECT_EQ(shell("systemd-analyze verify --man=no " MARLO_UNIT), "");
}

TEST_F(ServiceUnit, IsShutOffAsFarAsItsWorkAllows) {
    // The scale goes from 0 to 10; "OK" ends at 5.
    EXPECT_EQ(shell("systemd-analyze security --no-pager --offline=true --threshold=40 " MARLO_UNIT " >/dev/null"),
              "");
}

} // namespace
