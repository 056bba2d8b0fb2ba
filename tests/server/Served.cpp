#include "tests/server/Served.h"

#include <csignal>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <thread>

namespace marlo::test {

namespace {

std::string readFile(const std::string& file) {
    std::ifstream stream(file);
    return {std::istreambuf_iterator<char>(stream), {}};
}

/** What follows `label` on its line. */
std::string lineOf(const std::string& text, const std::string& label) {
    const std::size_t begin = text.find(label);
    if (begin == std::string::npos) {
        return "";
    }
    const std::size_t value = begin + label.size();
    return text.substr(value, text.find('\n', value) - value);
}

} // namespace

ServedTest::ServedTest() {
    _tables["listen"] = "http = [\"127.0.0.1:0\"]\nhttps = [\"127.0.0.1:0\"]\nsocket = \"marlo.sock\"\n";
    _tables["directories"] = "state = \"state\"\n";
    _tables["log"] = "sink = \"file:server.log\"\nlevel = \"debug\"\n";
    _arguments = {MARLO_EXECUTABLE, "serve", "--trial", "--config", path("server.toml")};
    _environment = {{"ORV_AGENT_TREE", tree()}, {"LC_ALL", "C"}};
}

ServedTest::~ServedTest() {
    if (HasFailure()) {
        std::cerr << "the server said:\n" << _said << readFile(path("server.err")) << "its log:\n" << log();
    }
}

void ServedTest::writeConfiguration() const {
    std::string text;
    for (const auto& [name, table] : _tables) {
        text += "[" + name + "]\n" + table;
    }
    write("server.toml", text);
}

void ServedTest::serveSite() {
    for (const char* name : {"schema", "providers"}) {
        configure("directories", std::string(name) + " = [\"" MARLO_SITE "/" + name + "\"]\n");
    }
}

void ServedTest::serveAccountsNamed(const std::vector<std::string>& names) {
    serveAccounts();
    std::string commands = "hash=$(openssl passwd -6 secret)\n"
                           "for file in passwd shadow; do cp -p /etc/$file $file; done\n";
    int number = 54320;
    for (const std::string& name : names) {
        commands += "echo " + name + ":x:" + std::to_string(++number) + ":54321::/:/bin/sh >>passwd\n" + "echo " +
                    name + ":$hash:19000:0:99999:7::: >>shadow\n";
    }
    startBehind(commands + "for file in passwd shadow; do mount --bind $file /etc/$file; done");
}

void ServedTest::start() {
    writeConfiguration();
    _server = std::make_unique<Process>(_arguments, _environment, directory(), path("server.err"), _prepare);
    _said = _server->readUntil("serving");
    ASSERT_NE(_said.find("serving"), std::string::npos) << _said << readFile(path("server.err"));
    _password = lineOf(_said, "\npassword: ");
}

int ServedTest::startInVain() {
    writeConfiguration();
    _server = std::make_unique<Process>(_arguments, _environment, directory(), path("server.err"), _prepare);
    _said = _server->readUntil("serving");
    return _server->wait(Patience);
}

int ServedTest::stop() {
    _server->signal(SIGTERM);
    return _server->wait(Patience);
}

std::string ServedTest::log() const {
    return readFile(path("server.log"));
}

std::string ServedTest::logWith(const std::string& text) const {
    const auto end = std::chrono::steady_clock::now() + Patience;
    std::string lines = log();
    while (lines.find(text) == std::string::npos && std::chrono::steady_clock::now() < end) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
        lines = log();
    }
    EXPECT_NE(lines.find(text), std::string::npos) << "never logged: " << text;
    return lines;
}

void ServedTest::readAnew(const std::string& former, const std::string& text) {
    const auto reloads = [this] {
        const std::string lines = log();
        std::size_t count = 0;
        for (std::size_t at = lines.find("event=reload"); at != lines.npos; at = lines.find("event=reload", at + 1)) {
            ++count;
        }
        return count;
    };
    bool isFound = false;
    for (auto& [name, table] : _tables) {
        if (const std::size_t place = table.find(former); place != std::string::npos) {
            table.replace(place, former.size(), text);
            isFound = true;
        }
    }
    ASSERT_TRUE(isFound) << former;
    writeConfiguration();
    const std::size_t before = reloads();
    _server->signal(SIGHUP);
    const auto end = std::chrono::steady_clock::now() + Patience;
    while (reloads() == before && std::chrono::steady_clock::now() < end) {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    ASSERT_GT(reloads(), before) << "never read anew";
}

unsigned short ServedTest::port(const std::string& scheme) const {
    const std::string address = lineOf(_said, "listening: " + scheme + " 127.0.0.1:");
    return static_cast<unsigned short>(std::stoul("0" + address));
}

std::string ServedTest::url(const std::string& scheme, const std::string& rest) const {
    return scheme + "://marlo:" + _password + "@127.0.0.1:" + std::to_string(port(scheme)) + "/" + rest;
}

std::string ServedTest::urlOf(const std::string& user, const std::string& password, const std::string& rest) const {
    return "http://" + user + ":" + password + "@127.0.0.1:" + std::to_string(port("http")) + "/" + rest;
}

Outcome ServedTest::wbemcli(std::vector<std::string> arguments) const {
    arguments.insert(arguments.begin(), {"timeout", "60", "wbemcli"});
    return runProgram(arguments, {}, "", directory());
}

Outcome ServedTest::curl(std::vector<std::string> arguments) const {
    arguments.insert(arguments.begin(), {"curl", "-sS", "--max-time", "60"});
    return runProgram(arguments, {}, "", directory());
}

std::string intrinsic(const std::string& method, const std::string& nameSpace, const std::string& parameters) {
    std::string path;
    std::istringstream parts(nameSpace);
    for (std::string part; std::getline(parts, part, '/');) {
        path += "<NAMESPACE NAME=\"" + part + "\"/>";
    }
    return R"(<?xml version="1.0" encoding="utf-8"?><CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="7" )"
           R"(PROTOCOLVERSION="1.0"><SIMPLEREQ><IMETHODCALL NAME=")" +
           method + "\"><LOCALNAMESPACEPATH>" + path + "</LOCALNAMESPACEPATH>" + parameters +
           "</IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>";
}

std::string classParameter(const std::string& className) {
    return R"(<IPARAMVALUE NAME="ClassName"><CLASSNAME NAME=")" + className + R"("/></IPARAMVALUE>)";
}

} // namespace marlo::test
