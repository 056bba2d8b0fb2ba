#include "agent/persistence/InterfacesFile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::Agent::Persistence;
using testing::ElementsAre;

std::vector<std::string> statements(const std::string& text) {
    std::vector<std::string> found;
    const InterfacesFile file(text);
    for (const auto& statement : file.statements()) {
        found.push_back(statement.keyword + "|" + file.valueOf(statement));
    }
    return found;
}

TEST(InterfacesFile, ReadsWhatIfupdownReads) {
    EXPECT_THAT(statements(""), ElementsAre());
    EXPECT_THAT(statements("\n\n  \n# c\n\t# c\n"), ElementsAre());
    EXPECT_THAT(statements("auto eth0"), ElementsAre("auto|eth0"));
    EXPECT_THAT(statements("  iface\teth0  inet static \n address 10.0.0.1/8\n"),
                ElementsAre("iface|eth0 inet static", "address|10.0.0.1/8"));
    EXPECT_THAT(statements("iface eth0 inet \\\n  static\n mt\\\nu 14\\\n00\n"),
                ElementsAre("iface|eth0 inet static", "mtu|1400"));
    EXPECT_THAT(statements("# a comment ends with its line \\\nauto eth0\n"), ElementsAre("auto|eth0"));
    EXPECT_THAT(statements("auto eth0 \\ \nauto eth1\n"), ElementsAre("auto|eth0 \\", "auto|eth1"));
    EXPECT_THAT(statements("auto eth0\r\n\r\niface eth0 inet dhcp\r\n"),
                ElementsAre("auto|eth0", "iface|eth0 inet dhcp"));
    EXPECT_THAT(statements("auto eth0\\"), ElementsAre("auto|eth0\\"));
    EXPECT_THAT(statements("auto eth0\\\n"), ElementsAre("auto|eth0"));
    EXPECT_THAT(statements("\\\n\\\n"), ElementsAre("|"));
    EXPECT_THAT(statements(std::string("auto \0x\n", 8)), ElementsAre(std::string("auto|\0x", 7)));
}

TEST(InterfacesFile, EndsAStanzaAtTheNextOpener) {
    const InterfacesFile file(
        "iface a inet static\n address 1\n# c\n up x\nauto a\nallow-hotplug a\nmapping a\n script s\n"
        "source x\nsource-directory y\nno-auto-down a\nno-scripts a\nrename a=b\n stray\n");
    std::vector<std::pair<std::string, std::size_t>> stanzas;
    for (const auto& stanza : file.stanzas()) {
        stanzas.emplace_back(file.header(stanza).keyword, stanza.end - stanza.header - 1);
    }
    EXPECT_THAT(stanzas,
                ElementsAre(std::pair("iface", 2U), std::pair("auto", 0U), std::pair("allow-hotplug", 0U),
                            std::pair("mapping", 1U), std::pair("source", 0U), std::pair("source-directory", 0U),
                            std::pair("no-auto-down", 0U), std::pair("no-scripts", 0U), std::pair("rename", 1U)));
}

struct Change {
    const char* before;
    const char* after;
};

/** Sets "address" to X, removes "gateway", and turns the method to "m". */
std::string changed(const std::string& before) {
    const InterfacesFile file(before);
    TextEdit edit;
    StanzaEditor editor(file, file.stanzas().front(), edit);
    editor.setHeaderWord(3, "m");
    editor.set("address", "X");
    editor.remove("gateway");
    return edit.applied(before);
}

TEST(StanzaEditor, ChangesNothingElse) {
    const Change changes[] = {
        {"iface a inet static\n", "iface a inet m\n    address X\n"},
        {"iface a inet static", "iface a inet m\n    address X"},
        {"iface a inet static\n\taddress 1", "iface a inet m\n\taddress X"},
        {"iface  a\tinet   static \r\n  address   1  \r\n", "iface  a\tinet   m \r\n  address   X  \r\n"},
        {"iface a inet \\\n   static\n", "iface a inet \\\n   m\n    address X\n"},
        {"iface a inet sta\\\ntic\n", "iface a inet m\n    address X\n"},
        {"iface a inet s\n address 1 \\\n   2 \\\n 3\n up x\n", "iface a inet m\n address X\n up x\n"},
        {"iface a inet s\n# address 9\n address 1\n # c\n gateway 2\n up y\n",
         "iface a inet m\n# address 9\n address X\n # c\n up y\n"},
        {"iface a inet s\n gateway 1 \\\n 2\n\n# c\niface b inet s\n gateway 3\n",
         "iface a inet m\n address X\n\n# c\niface b inet s\n gateway 3\n"},
        {"iface a inet s\n address 1\n address 2\n mtu 3\n", "iface a inet m\n address X\n mtu 3\n"},
        {"iface a inet s\n address\n mtu 3\n", "iface a inet m\n address X\n mtu 3\n"},
        {"# c\n\niface a inet s\n\tmtu 3\n", "# c\n\niface a inet m\n\taddress X\n\tmtu 3\n"},
        {"iface a inet s\niface b inet s\n\tmtu 3\n", "iface a inet m\n\taddress X\niface b inet s\n\tmtu 3\n"},
    };
    for (const auto& [before, after] : changes) {
        EXPECT_EQ(changed(before), after) << before;
    }
}

TEST(StanzaEditor, PutsANewOptionBehindThoseItBelongsTo) {
    const std::string text = "iface a inet static\n mtu 1\n address 2\n up x\n netmask 3\n down y\n";
    const InterfacesFile file(text);
    TextEdit edit;
    StanzaEditor editor(file, file.stanzas().front(), edit);
    editor.set("gateway", "4", {"address", "netmask"});
    editor.append("dns-search", "5");
    EXPECT_EQ(edit.applied(text), "iface a inet static\n mtu 1\n address 2\n up x\n netmask 3\n gateway 4\n down y\n"
                                  " dns-search 5\n");
}

} // namespace
