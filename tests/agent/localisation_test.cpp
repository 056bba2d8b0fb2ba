// The texts of messages, and what tells this system from others.
#include "agent/library/MessageTexts.h"
#include "agent/library/Monitoring.h"
#include "agent/library/SystemIdentifier.h"
#include "instrumentation/Localisation.h"
#include "tests/agent/TemporaryFile.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <cwchar>
#include <filesystem>
#include <set>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using Orv::Locale;
using Orv::make_string;
using Orv::ResourceString;
using Orv::Agent::Language;
using Orv::Agent::languageOf;
using Orv::Agent::readSystemIdentifier;
using Orv::Test::TemporaryFile;

constexpr std::array<const wchar_t*, 5> identifiers{L"MSGID_NAI_NIC_OFFLINE", L"MSGID_NAI_NIC_ONLINE",
                                                    L"MSGID_NAI_NIC_SWITCHOVER", L"MSGID_NAI_NIC_SWITCHBACK",
                                                    L"MSGID_NAI_NIC_FAILED"};

const Orv::ResourceLibrary* libraryIn(Language language) {
    return Locale::getResourceLibrary(1, static_cast<unsigned int>(language));
}

struct LocaleTest : testing::Test {
    LocaleTest() { clear(); }

    ~LocaleTest() override { clear(); }

    static void clear() {
        for (const char* name : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
            ::unsetenv(name);
        }
    }

    static Language language() { return static_cast<Language>(Locale::getLanguageId()); }
};

TEST_F(LocaleTest, IsThatOfTheFirstVariableThatIsSet) {
    EXPECT_EQ(language(), Language::english);
    ::setenv("LANG", "de_DE.UTF-8", 1);
    EXPECT_EQ(language(), Language::german);
    ::setenv("LC_MESSAGES", "en_GB.UTF-8", 1);
    EXPECT_EQ(language(), Language::english);
    ::setenv("LC_ALL", "de_AT", 1);
    EXPECT_EQ(language(), Language::german);
    ::setenv("LC_ALL", "", 1);
    EXPECT_EQ(language(), Language::english) << "empty is not set";
    ::setenv("LC_MESSAGES", "C", 1);
    EXPECT_EQ(language(), Language::english);
}

TEST(MessageTexts, AreInTheLanguageOfTheLocale) {
    for (const char* name : {"de", "de_DE", "de_CH.UTF-8", "de@euro", "de.UTF-8"}) {
        EXPECT_EQ(languageOf(name), Language::german) << name;
    }
    for (const char* name : {"", "C", "POSIX", "en_US.UTF-8", "fr_FR", "den", "d", "DE"}) {
        EXPECT_EQ(languageOf(name), Language::english) << name;
    }
}

TEST(MessageTexts, AreThereInEveryLanguageAndDiffer) {
    std::set<std::wstring> texts;
    for (const Language language : {Language::english, Language::german}) {
        for (const wchar_t* identifier : identifiers) {
            texts.insert(ResourceString(libraryIn(language), identifier));
        }
    }
    EXPECT_EQ(texts.size(), 2 * identifiers.size());
    EXPECT_EQ(texts.count(L""), 0U);
}

TEST(MessageTexts, HoldNoFormattingDirective) {
    for (const Language language : {Language::english, Language::german}) {
        const auto& texts = libraryIn(language)->texts();
        EXPECT_EQ(texts.size(), identifiers.size());
        for (const auto& [identifier, text] : texts) {
            EXPECT_EQ(text.find(L'%'), std::wstring_view::npos) << make_string(std::wstring(identifier));
            std::array<wchar_t, 512> buffer{};
            EXPECT_EQ(std::swprintf(buffer.data(), buffer.size(), std::wstring(text).c_str()),
                      static_cast<int>(text.size()));
            EXPECT_EQ(std::wstring(buffer.data()), text);
        }
    }
}

TEST(MessageTexts, AreEmptyWhereThereAreNone) {
    EXPECT_EQ(ResourceString(libraryIn(Language::english), L"MSGID_NAI_NIC_MELTED"), L"");
    EXPECT_EQ(ResourceString(libraryIn(Language::english), L""), L"");
    EXPECT_EQ(ResourceString(nullptr, identifiers[0]), L"");
    EXPECT_EQ(Locale::getResourceLibrary(2, 1), nullptr);
    EXPECT_EQ(Locale::getResourceLibrary(1, 0), nullptr);
    EXPECT_EQ(Locale::getResourceLibrary(1, 99), nullptr);
}

TEST(MakeString, WritesUtf8) {
    EXPECT_EQ(make_string(L""), "");
    EXPECT_EQ(make_string(L"a\u007f"), "a\x7f");
    EXPECT_EQ(make_string(L"\u00e4\u07ff"), "\xc3\xa4\xdf\xbf");
    EXPECT_EQ(make_string(L"\u20ac\uffff"), "\xe2\x82\xac\xef\xbf\xbf");
    EXPECT_EQ(make_string(L"\U00010000\U0010ffff"), "\xf0\x90\x80\x80\xf4\x8f\xbf\xbf");
    EXPECT_EQ(make_string(std::wstring(1, L'\0')), std::string(1, '\0'));
}

TEST(MakeString, ReplacesWhatIsNoCharacter) {
    const std::wstring wrong{static_cast<wchar_t>(0xD800), static_cast<wchar_t>(0xDFFF),
                             static_cast<wchar_t>(0x110000), static_cast<wchar_t>(-1)};
    EXPECT_EQ(make_string(wrong), "\xef\xbf\xbd\xef\xbf\xbd\xef\xbf\xbd\xef\xbf\xbd");
}

struct SystemIdentifierTest : testing::Test {
    void write(const std::string& path, const std::string& content) const {
        const std::filesystem::path file = root + path;
        std::filesystem::create_directories(file.parent_path());
        std::ofstream(file) << content;
    }

    void writeFirmware(const std::string& content) const { write("/sys/class/dmi/id/product_uuid", content); }

    TemporaryFile place{"unused"};
    std::string root = place.directory().string();
};

TEST_F(SystemIdentifierTest, IsTheFirmwaresElseTheMachines) {
    EXPECT_EQ(readSystemIdentifier(root), "");
    write("/etc/machine-id", "0123456789abcdef0123456789abcdef\n");
    EXPECT_EQ(readSystemIdentifier(root), "0123456789abcdef0123456789abcdef");
    writeFirmware("4C4C4544-0039-3510-8051-C4C04F4D4E32\n");
    EXPECT_EQ(readSystemIdentifier(root), "4C4C4544-0039-3510-8051-C4C04F4D4E32");
}

TEST_F(SystemIdentifierTest, PassesOverAFirmwareThatDoesNotKnow) {
    write("/etc/machine-id", "0123456789abcdef0123456789abcdef\n");
    for (const char* text : {"", "\n", "00000000-0000-0000-0000-000000000000\n", "Not Settable\n",
                             "FFFFFFFF-FFFF-FFFF-FFFF-FFFFFFFFFFFF", "03000200-0400-0500-0006-000700080009"}) {
        writeFirmware(text);
        EXPECT_EQ(readSystemIdentifier(root), "0123456789abcdef0123456789abcdef") << text;
    }
    write("/etc/machine-id", "uninitialized\n");
    EXPECT_EQ(readSystemIdentifier(root), "");
}

TEST(ProductUid, IsWhatTheHostSays) {
    EXPECT_EQ(make_string(Orv::Product::getUid()), readSystemIdentifier(""));
}

TEST(LocalTime, FollowsTheZoneOfTheHost) {
    const auto moment = std::chrono::system_clock::from_time_t(1236402249) + std::chrono::milliseconds(250);
    const auto fieldsIn = [&](const char* zone) {
        ::setenv("TZ", zone, 1);
        ::tzset();
        const auto fields = Orv::Agent::localTime(moment);
        ::unsetenv("TZ");
        ::tzset();
        return fields;
    };
    const auto berlin = fieldsIn("CET-1");
    EXPECT_EQ(berlin.year, 2009);
    EXPECT_EQ(berlin.month, 3);
    EXPECT_EQ(berlin.day, 7);
    EXPECT_EQ(berlin.hour, 6);
    EXPECT_EQ(berlin.minute, 4);
    EXPECT_EQ(berlin.second, 9);
    EXPECT_EQ(berlin.millisecond, 250);
    EXPECT_EQ(berlin.offset, 1);
    EXPECT_EQ(fieldsIn("EST5").offset, -5);
    EXPECT_EQ(fieldsIn("EST5").hour, 0);
    EXPECT_EQ(fieldsIn("UTC0").offset, 0);
    EXPECT_EQ(fieldsIn("IST-5:30").offset, 5);
}

} // namespace
