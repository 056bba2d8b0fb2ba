// Many clients at once, readers and writers, over both transports.
#include "tests/server/Connection.h"
#include "tests/server/Served.h"

#include <atomic>
#include <cstdlib>
#include <thread>

#include <gmock/gmock.h>

namespace marlo::test {
namespace {

constexpr unsigned Clients = 200;
constexpr unsigned OneWriterIn = 8;

/** Long enough to see them meet; a minute and more when SERVED_LOAD_SECONDS says so. */
std::chrono::seconds duration() {
    const char* const seconds = std::getenv("SERVED_LOAD_SECONDS");
    return std::chrono::seconds(seconds == nullptr ? 3 : std::atoi(seconds));
}

std::string pathOf(const std::string& adapter) {
    return R"(<INSTANCENAME CLASSNAME="MARLO_NetworkAdapterConfiguration"><KEYBINDING NAME="SettingID"><KEYVALUE )"
           R"(VALUETYPE="string">)" +
           adapter + "</KEYVALUE></KEYBINDING></INSTANCENAME>";
}

std::string readBody() {
    return intrinsic("GetInstance", "root/tavis",
                     "<IPARAMVALUE NAME=\"InstanceName\">" + pathOf("eth0") + "</IPARAMVALUE>");
}

std::string writeBody(unsigned number) {
    return intrinsic("SetProperty", "root/tavis",
                     R"(<IPARAMVALUE NAME="PropertyName"><VALUE>DNSDomain</VALUE></IPARAMVALUE>)"
                     R"(<IPARAMVALUE NAME="InstanceName">)" +
                         pathOf("eth1") + R"(</IPARAMVALUE><IPARAMVALUE NAME="NewValue"><VALUE>d)" +
                         std::to_string(number) + ".example.org</VALUE></IPARAMVALUE>");
}

class Load : public ServedTest {
  protected:
    /** One client until the end; counts what it is answered. */
    void work(unsigned number, std::chrono::steady_clock::time_point end) {
        Connection connection(port("http"), "marlo:" + password());
        const bool writes = number % OneWriterIn == 0;
        const std::string method = writes ? "SetProperty" : "GetInstance";
        const std::string body = writes ? writeBody(number) : readBody();
        while (std::chrono::steady_clock::now() < end) {
            const HttpAnswer answer = connection.call(method, "root/tavis", body);
            const bool good = answer.status == 200 && answer.body.find("<ERROR") == std::string::npos &&
                              (writes || answer.body.find("<VALUE>198.51.100.23</VALUE>") != std::string::npos);
            ++(good ? (writes ? written : read) : failed);
            if (!good && failed < 5) {
                ADD_FAILURE() << method << ": " << answer.status << " " << answer.body;
            }
            if (answer.status == 0) {
                return;
            }
        }
    }

    std::atomic<std::uint64_t> read{0};
    std::atomic<std::uint64_t> written{0};
    std::atomic<std::uint64_t> failed{0};
};

TEST_F(Load, IsBorneByTwoHundredReadersAndWriters) {
    configure("log", "");
    start();
    const auto end = std::chrono::steady_clock::now() + duration();
    std::vector<std::thread> clients;
    for (unsigned number = 0; number < Clients; ++number) {
        clients.emplace_back([this, number, end] { work(number, end); });
    }
    for (std::thread& client : clients) {
        client.join();
    }
    std::cerr << read << " reads, " << written << " writes, " << failed << " failed\n";
    EXPECT_EQ(failed, 0U);
    EXPECT_GE(read, Clients - Clients / OneWriterIn);
    EXPECT_GE(written, Clients / OneWriterIn);
    EXPECT_EQ(stop(), 0);
}

} // namespace
} // namespace marlo::test
