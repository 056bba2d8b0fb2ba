/** Who is known without a password: peers of the local socket, and those with a certificate. */
#include "tests/security/GatekeeperFixture.h"

#include <optional>

#include <unistd.h>

namespace {

using namespace marlo::test;
using marlo::http::Peer;
using marlo::http::Transport;
using marlo::security::Admission;
using marlo::security::Role;

Peer localPeer(std::optional<unsigned> user) {
    Peer peer;
    peer.transport = Transport::local;
    peer.address = "local";
    peer.userId = user;
    return peer;
}

Peer tlsPeer(const std::string& commonName) {
    Peer peer = tcpPeer();
    peer.transport = Transport::tls;
    peer.commonName = commonName;
    return peer;
}

TEST_F(GatekeeperTest, KnowsLocalPeersByTheirUserId) {
    const Admission root = admit({}, localPeer(0));
    EXPECT_EQ(root.identity.name(), "root");
    EXPECT_TRUE(root.identity.may(Role::change));
    EXPECT_TRUE(root.identity.may(Role::subscribe));
    EXPECT_TRUE(admit({}, localPeer(geteuid())).identity.may(Role::change));
    const Admission daemon = admit({}, localPeer(1));
    EXPECT_EQ(daemon.identity.name(), "daemon");
    EXPECT_TRUE(daemon.identity.may(Role::read));
    EXPECT_FALSE(daemon.identity.may(Role::change));
    EXPECT_EQ(_accounts->asked, 0);
}

TEST_F(GatekeeperTest, RefusesLocalPeersWithoutARole) {
    EXPECT_EQ(outcome({}, localPeer(2)), "401");
    EXPECT_EQ(outcome({}, localPeer(4294967294U)), "401");
    EXPECT_EQ(outcome({}, localPeer(std::nullopt)), "401");
    EXPECT_EQ(outcome({basic("trial:p")}, localPeer(2)), "401") << "nobody is asked for a name here";
    EXPECT_EQ(_log.size(), 4U);
}

TEST_F(GatekeeperTest, KnowsCertificatesByTheirCommonName) {
    const Admission admission = admit({}, tlsPeer("daemon"));
    EXPECT_EQ(admission.identity.name(), "daemon");
    EXPECT_FALSE(admission.identity.may(Role::change));
    EXPECT_EQ(outcome({}, tlsPeer("bin")), "401");
    EXPECT_EQ(outcome({}, tlsPeer("no-such-user")), "401");
    EXPECT_EQ(outcome({}, tlsPeer("trial")), "401");
    EXPECT_EQ(outcome({}, tlsPeer("")), "401");
}

TEST_F(GatekeeperTest, KnowsNoCertificateWithoutTls) {
    Peer peer = tlsPeer("root");
    peer.transport = Transport::tcp;
    EXPECT_EQ(outcome({}, peer), "401");
}

TEST_F(GatekeeperTest, GoesByTheFieldWhereThereIsACertificateToo) {
    EXPECT_EQ(outcome({basic("root:good")}, tlsPeer("daemon")), "root");
    EXPECT_EQ(outcome({basic("root:bad")}, tlsPeer("daemon")), "401");
    EXPECT_EQ(outcome({"Bearer x"}, tlsPeer("daemon")), "401");
}

TEST_F(GatekeeperTest, KnowsNoUserIdBeyondTheLocalSocket) {
    Peer peer = tcpPeer();
    peer.userId = 0;
    EXPECT_EQ(outcome({}, peer), "401");
}

} // namespace
