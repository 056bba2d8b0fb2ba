/** @file Subscriptions as users have them: wbemcli, the command line, and restarts of the server. */
#include "tests/subscriptions/SubscribedServer.h"

#include <csignal>
#include <thread>

namespace marlo::test {
namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

constexpr const char* offline = "MARLO_NetworkAdapterOfflineEvent";

class ServedSubscriptions : public SubscribedServer {
  protected:
    void SetUp() override { start(); }
};

TEST_F(ServedSubscriptions, AreMadeAndRemovedByWbemcli) {
    const std::string filter = "CIM_IndicationFilter";
    const std::string destination = "CIM_ListenerDestinationCIMXML";
    printed({"ci", interop(filter + "." + keys(filter, "f")),
             keys(filter, "f") + ",Query=\"SELECT * FROM MARLO_NetworkAdapterOfflineEvent\",QueryLanguage=\"WQL\"," +
                 "SourceNamespace=\"root/tavis\""});
    printed({"ci", interop(destination + "." + keys(destination, "d")),
             keys(destination, "d") + ",Destination=\"" + listener.url() + "\""});
    const auto endsAt = [&](const std::string& host) {
        return "Filter=" + reference(host, filter, "f") + ",Handler=" + reference(host, destination, "d");
    };
    const std::string ends = endsAt("localhost"); // a path with a point in its host is too much for wbemcli
    printed({"ci", interop("CIM_IndicationSubscription." + ends), endsAt("127.0.0.1")});
    EXPECT_THAT(printed({"ein", interop("CIM_IndicationSubscription")}), HasSubstr("CIM_IndicationSubscription."));
    EXPECT_THAT(printed({"ain", "-ac", "CIM_IndicationSubscription", interop(filter + "." + keys(filter, "f"))}),
                HasSubstr(destination));
    EXPECT_THAT(printed({"gi", "-nl", interop("CIM_IndicationSubscription." + ends)}),
                AllOf(HasSubstr("-SubscriptionState=2"), HasSubstr("-OnFatalErrorPolicy=2")));
    EXPECT_THAT(printed({"gi", "-nl", interop(destination + "." + keys(destination, "d"))}),
                HasSubstr("-PersistenceType=2"));

    play("status eth2 12\n");
    ASSERT_TRUE(listener.await(1));
    EXPECT_THAT(listener.received()[0].body, HasSubstr(offline));

    EXPECT_NE(wbemcli({"di", interop(filter + "." + keys(filter, "f"))}).exitCode, 0);
    printed({"di", interop("CIM_IndicationSubscription." + ends)});
    printed({"di", interop(filter + "." + keys(filter, "f"))});
    printed({"di", interop(destination + "." + keys(destination, "d"))});
    EXPECT_EQ(printed({"ein", interop("CIM_IndicationSubscription")}), "");
    EXPECT_THAT(printed({"ein", interop(filter)}), Not(HasSubstr("Name=\"f\"")));
}

TEST_F(ServedSubscriptions, AreMadeListedAndRemovedOnTheCommandLine) {
    const auto made = json({"subscribe", listener.url()});
    ASSERT_THAT(made, SizeIs(4)) << made;
    EXPECT_EQ(made[0]["listener"], "marlo:listener-1");
    EXPECT_EQ(made[0]["filter"], "marlo:adapter-online");
    EXPECT_EQ(made[0]["enabled"], true);
    EXPECT_EQ(json({"subscribe", listener.url()}), made);
    EXPECT_EQ(json({"subscriptions"}), made);
    const Outcome table = command({"subscriptions"});
    EXPECT_THAT(table.out, AllOf(HasSubstr("LISTENER"), HasSubstr("marlo:adapter-offline"), HasSubstr("enabled")));

    const auto filtered = json({"subscribe", "http://127.0.0.1:9/", "--filter",
                                "SELECT Message FROM CIM_AlertIndication WHERE PerceivedSeverity > 2"});
    ASSERT_THAT(filtered, SizeIs(1));
    EXPECT_EQ(filtered[0]["filter"], "marlo:filter-1");
    EXPECT_THAT(json({"unsubscribe", "marlo:filter-1"}), SizeIs(1));
    EXPECT_THAT(json({"unsubscribe", listener.url()}), SizeIs(4));
    EXPECT_THAT(json({"subscriptions"}), IsEmpty());
    EXPECT_EQ(printed({"ein", interop("CIM_ListenerDestination")}), "");
    EXPECT_EQ(command({"unsubscribe", "marlo:filter-1"}).exitCode, 1);
    EXPECT_EQ(json({"unsubscribe", "--all"}), nlohmann::json::array());
    EXPECT_EQ(command({"unsubscribe"}).exitCode, 2);
}

TEST_F(ServedSubscriptions, LeaveNothingBehindWhenOneIsRefused) {
    const Outcome outcome = command({"subscribe", listener.url(), offline, "MARLO_NoSuchEvent"});
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.err, AllOf(HasSubstr("CIM_ERR_INVALID_CLASS (5)"), HasSubstr("MARLO_NoSuchEvent")));
    EXPECT_THAT(json({"subscriptions"}), IsEmpty());
    EXPECT_EQ(printed({"ein", interop("CIM_ListenerDestination")}), "");
    const Outcome noUrl = command({"subscribe", "ftp://h/"});
    EXPECT_EQ(noUrl.exitCode, 1);
    EXPECT_THAT(noUrl.err, HasSubstr("CIM_ERR_INVALID_PARAMETER (4)"));
}

TEST_F(ServedSubscriptions, SayThatNoServerRuns) {
    const Outcome outcome = runProgram({MARLO_EXECUTABLE, "subscriptions", "--socket", path("nobody.sock")});
    EXPECT_EQ(outcome.exitCode, 1);
    EXPECT_THAT(outcome.err, HasSubstr("not running"));
}

TEST_F(ServedSubscriptions, AreCountedInTheStatus) {
    json({"subscribe", listener.url(), offline});
    play("status eth2 12\nstatus eth2 1\nstatus eth2 12\n");
    ASSERT_TRUE(listener.await(2));
    nlohmann::json deliveries;
    for (int i = 0; i < 500 && (deliveries.empty() || deliveries[0]["sent"] != 2); ++i) {
        deliveries = json({"status"})["deliveries"];
    }
    ASSERT_THAT(deliveries, SizeIs(1));
    EXPECT_EQ(deliveries[0]["destination"], "marlo:listener-1");
    EXPECT_EQ(deliveries[0]["url"], listener.url());
    EXPECT_EQ(deliveries[0]["sent"], 2);
    EXPECT_EQ(deliveries[0]["queued"], 0);
    EXPECT_THAT(command({"status"}).out, AllOf(HasSubstr("LISTENER"), HasSubstr(listener.url())));
}

TEST_F(ServedSubscriptions, OutliveTheServer) {
    json({"subscribe", listener.url(), offline});
    play("status eth2 12\n");
    ASSERT_TRUE(listener.await(1));
    EXPECT_EQ(stop(), 0);
    start();
    EXPECT_THAT(json({"subscriptions"}), SizeIs(1));
    play("status eth2 1\nstatus eth2 12\n");
    ASSERT_TRUE(listener.await(2));
    EXPECT_THAT(listener.numbers(), ElementsAre(0, 1));
    EXPECT_EQ(listener.received()[0].context, listener.received()[1].context);
}

TEST_F(ServedSubscriptions, ReachAListenerThatWasAwayWhileTheServerStarted) {
    json({"subscribe", listener.url(), offline});
    listener.stop();
    play("status eth2 12\nstatus eth2 1\nstatus eth2 12\n");
    for (int i = 0; i < 1000 && json({"status"})["deliveries"][0]["queued"] != 2; ++i) {
    }
    EXPECT_EQ(stop(), 0);
    start();
    listener.start();
    ASSERT_TRUE(listener.await(2, Patience));
    EXPECT_THAT(listener.numbers(), ElementsAre(0, 1));
}

TEST_F(ServedSubscriptions, AreNotToBeHadFromTwoServers) {
    const Outcome second = runProgram({"timeout", "20", MARLO_EXECUTABLE, "serve", "--config", path("server.toml"),
                                       "--socket", path("second.sock"), "--http", "none", "--https", "none"});
    EXPECT_EQ(second.exitCode, 1);
    EXPECT_THAT(second.err, HasSubstr("marlo.db"));
}

} // namespace
} // namespace marlo::test
