// What wbemcli, as Debian has it, makes of the server: every operation that it knows, over HTTP and HTTPS.
#include "tests/server/Served.h"

#include <filesystem>
#include <fstream>

#include <gmock/gmock.h>
#include <sys/stat.h>

namespace marlo::test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::MatchesRegex;
using testing::Not;
using testing::StartsWith;

/** Without the line breaks and stars that wbemcli frames its errors with. */
std::string errorOf(const Outcome& outcome) {
    const std::size_t begin = outcome.err.find("wbemcli: ");
    return begin == std::string::npos ? outcome.err
                                      : outcome.err.substr(begin + 9, outcome.err.find('\n', begin) - begin - 9);
}

/** A server with the site's things; `at` gives wbemcli's paths, and its answers begin with `host`. */
class Wbemcli : public ServedTest {
  protected:
    Wbemcli() { serveSite(); }

    void SetUp() override {
        start();
        host = "127.0.0.1:" + std::to_string(port("http")) + "/";
    }

    [[nodiscard]] std::string thing(const std::string& id = "") const {
        return url("http", "root/served:SERVED_Thing" + (id.empty() ? "" : ".Id=\"" + id + "\""));
    }

    [[nodiscard]] std::string adapter(const std::string& name = "", const std::string& scheme = "http") const {
        return url(scheme, "root/tavis:MARLO_NetworkAdapterConfiguration" +
                               (name.empty() ? "" : ".SettingID=\"" + name + "\""));
    }

    /** What it prints when it succeeds. */
    [[nodiscard]] std::string printed(const std::vector<std::string>& arguments) const {
        const Outcome outcome = wbemcli(arguments);
        EXPECT_EQ(outcome.exitCode, 0) << testing::PrintToString(arguments) << outcome.err;
        EXPECT_EQ(outcome.err, "") << testing::PrintToString(arguments);
        return outcome.out;
    }

    /** What it says when it fails. */
    [[nodiscard]] std::string failed(const std::vector<std::string>& arguments) const {
        const Outcome outcome = wbemcli(arguments);
        EXPECT_NE(outcome.exitCode, 0) << testing::PrintToString(arguments) << outcome.out;
        EXPECT_EQ(outcome.out, "") << testing::PrintToString(arguments);
        return errorOf(outcome);
    }

    std::string host;
};

TEST_F(Wbemcli, ReadsAdapters) {
    EXPECT_EQ(printed({"ein", adapter()}),
              host + "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"bond0\"\n" + host +
                  "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth0\"\n" + host +
                  "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth1\"\n" + host +
                  "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth2\"\n");
    EXPECT_THAT(printed({"ei", "-nl", adapter()}),
                AllOf(HasSubstr("-IPAddress=\"192.0.2.10\",\"2001:db8:0:2::10\"\n"), HasSubstr("-DHCPEnabled=TRUE\n"),
                      HasSubstr("-SettingID=\"eth2\"\n")));
    EXPECT_EQ(printed({"gi", "-nl", adapter("eth0"), "DNSServerSearchOrder,DHCPEnabled"}),
              host + "root/tavis:MARLO_NetworkAdapterConfiguration.SettingID=\"eth0\"\n-DHCPEnabled=TRUE\n"
                     "-DNSServerSearchOrder=\"198.51.100.2\"\n\n");
    EXPECT_EQ(printed({"gp", adapter("eth1"), "MACAddress"}), "02:00:5e:10:00:03\n");
    EXPECT_THAT(printed({"ein", url("http", "root/tavis:CIM_ManagedElement")}),
                HasSubstr("MARLO_NetworkAdapterConfiguration.SettingID=\"eth1\""));
}

TEST_F(Wbemcli, ChangesAdapters) {
    EXPECT_THAT(printed({"cm", adapter("eth1"), "EnableStatic.IPAddress=203.0.113.9,SubnetMask=255.255.255.0"}),
                HasSubstr("EnableStatic: "));
    EXPECT_EQ(printed({"gp", adapter("eth1"), "IPAddress"}), "203.0.113.9\n");
    EXPECT_EQ(printed({"sp", adapter("eth1"), "DNSDomain=example.org"}), "");
    EXPECT_EQ(printed({"gp", adapter("eth1"), "DNSDomain"}), "example.org\n");
    EXPECT_THAT(failed({"cm", adapter("eth1"), "EnableStatic.IPAddress=224.0.0.1,SubnetMask=255.255.255.0"}),
                AllOf(HasSubstr("(1) CIM_ERR_FAILED"), HasSubstr("224.0.0.1")));
}

TEST_F(Wbemcli, ReadsInstances) {
    EXPECT_EQ(printed({"ein", thing()}),
              host + "root/served:SERVED_Thing.Id=\"one\"\n" + host + "root/served:SERVED_Thing.Id=\"two\"\n");
    EXPECT_EQ(printed({"gi", thing("one"), "Text"}), host + "root/served:SERVED_Thing.Id=\"one\" Text=\"first\"\n");
    EXPECT_EQ(printed({"gp", thing("two"), "Number"}), "2\n");
    EXPECT_THAT(printed({"ei", "-t", thing()}), HasSubstr("Id#=\"one\",Text=\"first\",Number=1"));
}

TEST_F(Wbemcli, GetsTextThatXmlCannotCarryReplaced) {
    EXPECT_THAT(printed({"gi", "-nl", thing("one")}),
                HasSubstr("-Odd=\"bell \xEF\xBF\xBD, no UTF-8 \xEF\xBF\xBD, <&>\"\n"));
}

TEST_F(Wbemcli, ChangesInstances) {
    EXPECT_EQ(printed({"sp", thing("one"), "Number=7"}), "");
    EXPECT_EQ(printed({"gp", thing("one"), "Number"}), "7\n");
    EXPECT_EQ(printed({"mi", thing("one"), "Text=\"changed\",Number=8"}), "");
    EXPECT_THAT(printed({"gi", thing("one"), "Text,Number"}), HasSubstr("Text=\"changed\",Number=8"));
}

TEST_F(Wbemcli, CreatesAndDeletesInstances) {
    EXPECT_EQ(printed({"ci", thing("three"), "Id=\"three\",Text=\"third\",Number=3"}),
              host + "root/served:SERVED_Thing.Id=\"three\"\n");
    EXPECT_EQ(printed({"gp", thing("three"), "Text"}), "third\n");
    EXPECT_THAT(failed({"ci", thing("three"), "Id=\"three\""}), StartsWith("Cim: (11) CIM_ERR_ALREADY_EXISTS"));
    EXPECT_EQ(printed({"di", thing("three")}), "");
    EXPECT_THAT(failed({"gi", thing("three")}), StartsWith("Cim: (6) CIM_ERR_NOT_FOUND"));
}

TEST_F(Wbemcli, FollowsAssociations) {
    EXPECT_THAT(printed({"ain", thing("one")}), MatchesRegex("[^/]+/root/served:SERVED_Thing.Id=\"two\"\n"));
    EXPECT_THAT(printed({"ai", "-nl", thing("one")}), HasSubstr("-Text=\"second\"\n"));
    EXPECT_THAT(printed({"rin", thing("two")}),
                HasSubstr("/root/served:SERVED_Link.From=root/served:SERVED_Thing.Id="));
    EXPECT_THAT(printed({"ri", "-nl", thing("two")}), HasSubstr("-To=root/served:SERVED_Thing.Id=\"two\"\n"));
    EXPECT_THAT(
        printed({"ain", "-ac", "SERVED_Link", "-arc", "SERVED_Thing", "-ar", "From", "-arr", "To", thing("one")}),
        HasSubstr("Id=\"two\""));
    EXPECT_EQ(printed({"ain", "-ar", "To", thing("one")}), "");
    EXPECT_EQ(printed({"rin", adapter("eth0")}), "");
}

TEST_F(Wbemcli, CallsMethods) {
    EXPECT_EQ(printed({"cm", thing("one"), "Say.Word=\"hello\""}),
              host + "root/served:SERVED_Thing.Id=\"one\" Say: hello, Twice (string): hellohello\n");
    EXPECT_THAT(printed({"cmx", thing("one"), "Say.Word=\"hello\""}),
                HasSubstr("<RETURNVALUE PARAMTYPE=\"string\"><VALUE>hello</VALUE></RETURNVALUE>"));
    EXPECT_EQ(failed({"cm", thing("one"), "Fail"}),
              "Cim: (1) CIM_ERR_FAILED: provider ServedThings threw: the method throws");
}

TEST_F(Wbemcli, ReadsClasses) {
    EXPECT_EQ(printed({"gc", "-nl", thing()}), host + "root/served:SERVED_Thing\n-Id=\n-Text=\n-Number=\n-Odd=\n\n");
    EXPECT_THAT(printed({"gcd", thing()}), StartsWith("<CLASS NAME=\"SERVED_Thing\">"));
    EXPECT_THAT(printed({"ecn", url("http", "root/served")}), HasSubstr(host + "root/served:SERVED_Link\n"));
    EXPECT_THAT(printed({"ecn", url("http", "root/served:CIM_LogicalElement")}),
                HasSubstr("CIM_EnabledLogicalElement\n"));
    EXPECT_THAT(printed({"ec", "-nl", url("http", "root/tavis")}), HasSubstr("-IPAddress=\n"));
    EXPECT_THAT(failed({"dc", thing()}), StartsWith("Cim: (7) CIM_ERR_NOT_SUPPORTED"));
}

TEST_F(Wbemcli, FindsTheServerInTheInteropNamespace) {
    for (const char* name : {"root/interop", "interop"}) {
        const std::string managers = printed({"ei", "-nl", url("http", std::string(name) + ":CIM_ObjectManager")});
        EXPECT_THAT(managers, HasSubstr("-ElementName=\"marlo\"\n")) << name;
        EXPECT_THAT(managers, HasSubstr("version ")) << name;
        EXPECT_THAT(printed({"ei", "-nl", url("http", std::string(name) + ":CIM_Namespace")}),
                    AllOf(HasSubstr("-Name=\"root/tavis\"\n"), HasSubstr("-Name=\"root/served\"\n"),
                          HasSubstr("-Name=\"root/interop\"\n")))
            << name;
    }
}

TEST_F(Wbemcli, IsToldWhatWasWrong) {
    EXPECT_THAT(failed({"gi", thing("none")}), StartsWith("Cim: (6) CIM_ERR_NOT_FOUND"));
    EXPECT_THAT(failed({"ei", url("http", "root/nowhere:X")}), StartsWith("Cim: (3) CIM_ERR_INVALID_NAMESPACE"));
    EXPECT_THAT(failed({"ei", url("http", "root/served:Nope")}), StartsWith("Cim: (5) CIM_ERR_INVALID_CLASS"));
    EXPECT_THAT(failed({"gc", url("http", "root/served:Nope")}), StartsWith("Cim: (6) CIM_ERR_NOT_FOUND"));
    EXPECT_THAT(failed({"ei", url("http", "root/served:SERVED_Throwing")}),
                StartsWith("Cim: (1) CIM_ERR_FAILED: provider ServedThings threw: thrown in the middle"));
    EXPECT_THAT(failed({"ei", url("http", "root/served:SERVED_Missing")}),
                AllOf(StartsWith("Cim: (1) CIM_ERR_FAILED: provider Missing"), HasSubstr("libNowhere.so")));
    EXPECT_THAT(failed({"cm", thing("one"), "Nothing"}), HasSubstr("CIM_ERR_METHOD_NOT_FOUND"));
}

TEST_F(Wbemcli, SpeaksTlsWithTheCertificateThatTheServerMade) {
    const std::string ours = path("state/certificate.pem");
    EXPECT_THAT(printed({"ein", "-noverify", adapter("", "https")}), HasSubstr("SettingID=\"eth0\""));
    EXPECT_THAT(printed({"ein", "-cacert", ours, adapter("", "https")}), HasSubstr("SettingID=\"eth0\""));
    EXPECT_THAT(failed({"ein", adapter("", "https")}), HasSubstr("Http Exception"));
    EXPECT_THAT(
        printed({"cm", "-cacert", ours, url("https", "root/served:SERVED_Thing.Id=\"one\""), "Say.Word=\"a\""}),
        HasSubstr("Say: a"));

    struct stat key {};

    ASSERT_EQ(::stat(path("state/key.pem").c_str(), &key), 0);
    EXPECT_EQ(key.st_mode & 0777U, 0600U);
}

TEST_F(Wbemcli, IsTurnedAwayWithoutThePassword) {
    const std::string rest =
        "@127.0.0.1:" + std::to_string(port("http")) + "/root/tavis:MARLO_NetworkAdapterConfiguration";
    for (const std::string& who : {std::string("marlo:wrong"), "other:" + password(), "marlo:" + password() + "x"}) {
        EXPECT_EQ(failed({"ein", "http://" + who + rest}), "Http Exception: Invalid username/password.") << who;
    }
    EXPECT_THAT(logWith("event=access"), Not(HasSubstr(password())));
}

TEST_F(Wbemcli, UsesTheLineThatTheServerPrints) {
    for (const std::string scheme : {"http://", "https://"}) {
        const std::size_t line = said().find("try: wbemcli ei -nl " +
                                             std::string(scheme == "https://" ? "-noverify " : "") + "'" + scheme);
        ASSERT_NE(line, std::string::npos) << said();
        const std::string command = said().substr(line + 5, said().find('\n', line) - line - 5);
        const Outcome outcome = runProgram({"sh", "-c", command});
        EXPECT_EQ(outcome.exitCode, 0) << command << outcome.err;
        EXPECT_THAT(outcome.out, HasSubstr("-SettingID=\"eth0\"\n")) << command;
    }
}

/** The server takes certificates that a certificate authority of the test's own has signed. */
class WbemcliWithCertificate : public ServedTest {
  protected:
    void SetUp() override {
        run("openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -keyout ca.key -out ca.pem "
            "-days 2 -subj /CN=authority");
        makeClient("marlo");
        makeClient("stranger");
        configure("tls", "client_ca = \"ca.pem\"\nrequire_client_certificate = true\n");
        start();
    }

    void run(const std::string& command) const {
        const Outcome outcome = runProgram({"sh", "-c", command}, {}, "", directory());
        ASSERT_EQ(outcome.exitCode, 0) << command << outcome.err;
    }

    void makeClient(const std::string& name) const {
        run("openssl req -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -keyout " + name + ".key -out " + name +
            ".csr -subj /CN=" + name + " && openssl x509 -req -in " + name +
            ".csr -CA ca.pem -CAkey ca.key -CAcreateserial -days 2 -out " + name + ".pem");
    }

    [[nodiscard]] Outcome ask(const std::vector<std::string>& options, const std::string& credentials) const {
        std::vector<std::string> arguments{"ein", "-noverify"};
        arguments.insert(arguments.end(), options.begin(), options.end());
        arguments.push_back("https://" + credentials + "127.0.0.1:" + std::to_string(port("https")) +
                            "/root/tavis:MARLO_NetworkAdapterConfiguration");
        return wbemcli(arguments);
    }
};

TEST_F(WbemcliWithCertificate, IsAskedForOne) {
    const std::string credentials = "marlo:" + password() + "@";
    const Outcome with = ask({"-clientcert", "marlo.pem", "-clientkey", "marlo.key"}, credentials);
    EXPECT_EQ(with.exitCode, 0) << with.err;
    EXPECT_THAT(with.out, HasSubstr("SettingID=\"eth0\""));
    const Outcome without = ask({}, credentials);
    EXPECT_NE(without.exitCode, 0);
    EXPECT_EQ(without.out, "");
}

} // namespace
} // namespace marlo::test
