/**
 * @file
 * A back end over a namespace and over the files of a host that is not there.
 */
#pragma once

#include "agent/linux/LinuxBackEnd.h"
#include "tests/linux/IpReport.h"
#include "tests/linux/TemporaryHost.h"
#include "tests/linux/TreeReading.h"
#include "tests/support/Namespace.h"

#include <memory>
#include <string>

#include <gtest/gtest.h>

namespace Orv::Test {

/** A namespace, the files of a host, and a back end over both. */
class BackEndFixture : public testing::Test {
  protected:
    void SetUp() override {
        REQUIRE_NAMESPACES();
        space = std::make_unique<Namespace>();
        // Duplicate address detection and addresses from nowhere would change what a test has set up.
        space->shell("echo 0 > /proc/sys/net/ipv6/conf/default/accept_dad; "
                     "echo 0 > /proc/sys/net/ipv6/conf/default/accept_ra");
        backEnd = makeBackEnd();
    }

    [[nodiscard]] std::unique_ptr<Agent::BackEnd> makeBackEnd() const {
        std::unique_ptr<Agent::BackEnd> made;
        space->run([&] { made = Agent::Linux::makeLinuxBackEnd({host.root()}); });
        return made;
    }

    /** Read on the test's own thread, which is in another namespace. */
    [[nodiscard]] std::shared_ptr<const Agent::Tree> tree() const { return backEnd->snapshot(); }

    void addPair(const std::string& name = "left", const std::string& peer = "right") const {
        space->ip("link add " + name + " type veth peer name " + peer);
        space->ip("link set " + name + " up");
        space->ip("link set " + peer + " up");
    }

    void expectAgreement() const {
        Report expected;
        const auto same = [&] {
            expected = ipReport(*space);
            return kernelProperties(*tree()) == expected;
        };
        EXPECT_TRUE(awaited(true, same)) << "the tree:\n"
                                         << toText(kernelProperties(*tree())) << "ip:\n"
                                         << toText(expected);
    }

    void expectStatus(const std::string& name, unsigned status) const {
        EXPECT_EQ(awaited(status, [&] { return numberOf(*tree(), name, NodeLexicon::PROP_STATUS); }), status) << name;
    }

    void expectIpv6(const std::string& name, const std::string& address) const {
        EXPECT_EQ(awaited(address, [&] { return textOf(*tree(), name, NodeLexicon::PROP_IPV6_ADDRESS); }), address)
            << name;
    }

    TemporaryHost host;
    std::unique_ptr<Namespace> space;
    std::unique_ptr<Agent::BackEnd> backEnd;
};

} // namespace Orv::Test
