#include "agent/persistence/StanzaChange.h"
#include "fuzz/Wanted.h"

/** Any text as an interfaces file: taken apart in order, edited within one stanza, and read back as wanted. */
namespace {

using namespace Orv::Agent::Persistence;
using Orv::Fuzz::require;

void requireOrder(const InterfacesFile& file) {
    std::size_t end = 0;
    for (const auto& statement : file.statements()) {
        require(statement.begin >= end && statement.end > statement.begin, "statements follow one another");
        end = statement.end;
        std::size_t place = statement.begin;
        const auto words = file.wordsOf(statement);
        require(words.front().text == statement.keyword, "a keyword is the first word");
        for (const auto& word : words) {
            require(word.begin >= place && word.end >= word.begin && word.end <= end, "words lie in their statement");
            place = word.end;
        }
    }
    require(end <= file.text().size(), "statements lie in the text");
}

bool isIpv4Stanza(const InterfacesFile& file, const InterfacesFile::Stanza& stanza) {
    const auto words = file.wordsOf(file.header(stanza));
    return words.front().text == "iface" && words.size() >= 4 && words[2].text == "inet";
}

void requireChange(const InterfacesFile& file, const InterfacesFile::Stanza& stanza,
                   const Orv::Agent::AdapterSettings& wanted) {
    const auto after = changedStanza(file, stanza, wanted, true);
    if (!after) {
        return;
    }
    const std::size_t begin = file.header(stanza).begin;
    const std::size_t end = file.statements()[stanza.end - 1].end;
    const std::string_view rest = std::string_view(file.text()).substr(end);
    require(after->starts_with(std::string_view(file.text()).substr(0, begin)), "what is in front stays");
    require(after->ends_with(rest), "what is behind stays");
    const InterfacesFile result(*after);
    const auto& changed = result.stanzas().at(static_cast<std::size_t>(&stanza - file.stanzas().data()));
    require(changedStanza(result, changed, wanted, true) == *after, "a second change changes nothing");
    Orv::Agent::TextEdit unused;
    const StanzaEditor editor(result, changed, unused);
    if (wanted.ipv4 && wanted.ipv4->address) {
        require(editor.value("address").value_or("").starts_with(wanted.ipv4->address->address.text()), "address");
        require(editor.value("gateway") == wanted.ipv4->gateway->text(), "gateway");
    } else if (wanted.ipv4) {
        require(!editor.value("address") && !editor.value("gateway"), "no address, no gateway");
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const auto [wanted, text] = Orv::Fuzz::wantedAndText(data, size);
    const InterfacesFile file{std::string(text)};
    requireOrder(file);
    for (const auto& stanza : file.stanzas()) {
        if (isIpv4Stanza(file, stanza)) {
            requireChange(file, stanza, wanted);
            break;
        }
    }
    return 0;
}
