/** @file Documents that were made to do harm, and the limits that they meet. */
#include "tests/cimxml/Documents.h"

#include <chrono>
#include <random>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using cimxml::Limits;
using cimxml::MessageError;
using testing::HasSubstr;
using Kind = MessageError::Kind;

std::string repeat(const std::string& text, std::size_t count) {
    std::string repeated;
    for (std::size_t i = 0; i < count; ++i) {
        repeated += text;
    }
    return repeated;
}

std::string withArgument(const std::string& element, const std::string& attributes = "") {
    return intrinsic("Any", "<IPARAMVALUE NAME=\"It\"" + attributes + ">" + element + "</IPARAMVALUE>");
}

/** A request behind another beginning. */
std::string behind(const std::string& prolog, const std::string& value = "x") {
    const std::string document = withArgument("<VALUE>" + value + "</VALUE>");
    return prolog + document.substr(document.find("<CIM "));
}

void expectRefusal(const std::string& document, Kind kind, const std::string& reason, const Limits& limits = {}) {
    const auto refusal = refusalOf(document, limits);
    ASSERT_TRUE(refusal) << reason;
    EXPECT_EQ(refusal->kind, kind) << refusal->reason;
    EXPECT_THAT(refusal->reason, HasSubstr(reason));
}

/** No document may have the parser write to standard error. */
class Hostile : public testing::Test {
  protected:
    Hostile() { testing::internal::CaptureStderr(); }

    ~Hostile() override { EXPECT_EQ(testing::internal::GetCapturedStderr(), ""); }
};

TEST_F(Hostile, DoctypeIsOverlookedUnlessItDeclares) {
    for (const char* doctype : {"<!DOCTYPE CIM>", "<!DOCTYPE CIM SYSTEM \"http://127.0.0.1:1/cim.dtd\">",
                                "<!DOCTYPE CIM SYSTEM '/proc/self/mem'>",
                                "<!DOCTYPE CIM PUBLIC \"-//x//y\" \"file:///etc/passwd?[>]'\">"}) {
        EXPECT_FALSE(refusalOf(behind(doctype))) << doctype << refusalOf(behind(doctype))->reason;
    }
    for (const char* doctype : {"<!DOCTYPE CIM []>", "<!DOCTYPE CIM [<!ENTITY a \"b\">]>",
                                "<!DOCTYPE CIM SYSTEM \"x\" [<!ENTITY % a SYSTEM \"b\"> %a;]>",
                                "<!DOCTYPE CIM [<!ATTLIST MESSAGE ID CDATA \"1\">]>"}) {
        expectRefusal(behind(doctype), Kind::notValid, "declarations in a DOCTYPE are not read");
    }
}

TEST_F(Hostile, EntitiesThatGrowAreRefusedBeforeTheyDo) {
    std::string declarations = "<!ENTITY a0 \"laugh\">";
    for (int i = 1; i < 20; ++i) {
        declarations +=
            "<!ENTITY a" + std::to_string(i) + " \"" + repeat("&a" + std::to_string(i - 1) + ";", 10) + "\">";
    }
    expectRefusal(behind("<!DOCTYPE CIM [" + declarations + "]>", "&a19;"), Kind::notValid,
                  "declarations in a DOCTYPE");
}

TEST_F(Hostile, EntitiesAreRefusedButForThePredefinedOnes) {
    expectRefusal(withArgument("<VALUE>&nbsp;</VALUE>"), Kind::notWellFormed, "the entity 'nbsp'");
    expectRefusal(behind("<!DOCTYPE CIM SYSTEM \"x.dtd\">", "&file;"), Kind::notWellFormed, "the entity 'file'");
    expectRefusal(withArgument("<CLASSNAME NAME=\"&file;\"/>"), Kind::notWellFormed, "the entity 'file'");
    EXPECT_EQ(std::get<cimxml::ClassName>(argumentOf("<CLASSNAME NAME=\"&amp;&#38;&lt;&quot;\"/>")).name, "&&<\"");
}

TEST_F(Hostile, ReferencesToWhatIsNoCharacterAreRefused) {
    for (const char* reference : {"&#0;", "&#1;", "&#x1F;", "&#xD800;", "&#xFFFE;", "&#x110000;", "&#;", "&#x;", "&",
                                  "&;", "&#99999999999999999999;", "&lt"}) {
        expectRefusal(withArgument("<VALUE>" + std::string(reference) + "</VALUE>"), Kind::notWellFormed,
                      "line 3, column ");
    }
}

TEST_F(Hostile, BytesThatAreNotUtf8AreRefusedWhereverTheyAre) {
    const std::string sample = "<!-- c -->" + withArgument("<VALUE>t</VALUE><!-- c -->", " x=\"a\"") + "<?p i?>";
    const std::string document = sample.substr(10);
    for (const char* bytes : {"\x80", "\xC0\xAF", "\xED\xA0\x80", "\xF4\x90\x80\x80", "\xE2\x82", "\xFF"}) {
        for (const char* before : {"t</VALUE>", "\"a\"", " c -->", "i?>", "VALUE>"}) {
            std::string changed = document;
            changed.insert(changed.find(before), bytes);
            expectRefusal(changed, Kind::notWellFormed, "bytes that are not UTF-8");
        }
    }
}

TEST_F(Hostile, NulsAreRefusedWhereverTheyAre) {
    const std::string document = withArgument("<VALUE>t</VALUE>");
    for (std::size_t i = 0; i <= document.size(); ++i) {
        std::string changed = document;
        changed.insert(i, 1, '\0');
        expectRefusal(changed, Kind::notWellFormed, "a NUL");
    }
}

TEST_F(Hostile, ControlCharactersAndNonCharactersAreRefused) {
    for (const char* character : {"\x01", "\x0B", "\x1F", "\xEF\xBF\xBE", "\xEF\xBF\xBF"}) {
        expectRefusal(withArgument("<VALUE>" + std::string(character) + "</VALUE>"), Kind::notWellFormed,
                      "line 3, column ");
        expectRefusal(withArgument("<CLASSNAME NAME=\"" + std::string(character) + "\"/>"), Kind::notWellFormed,
                      "line 3, column ");
    }
}

TEST_F(Hostile, OnlyUtf8IsRead) {
    const std::string document = withArgument("<VALUE>\xE2\x82\xAC</VALUE>");
    EXPECT_FALSE(refusalOf("\xEF\xBB\xBF" + document));
    EXPECT_FALSE(refusalOf(behind("<?xml version='1.0' encoding = 'UTF-8'?>")));
    EXPECT_FALSE(refusalOf(behind("")));
    for (const char* encoding : {"ISO-8859-1", "UTF-16", "US-ASCII", "UTF-7", "EBCDIC-CP-US", "x"}) {
        expectRefusal(behind("<?xml version=\"1.0\" encoding=\"" + std::string(encoding) + "\"?>"),
                      Kind::notWellFormed, "which is not UTF-8");
    }
    std::string wide = "\xFF\xFE";
    for (const char c : document) {
        wide += {c, '\0'};
    }
    expectRefusal(wide, Kind::notWellFormed, "line 1, column 1: bytes that are not UTF-8");
    expectRefusal(wide.substr(2), Kind::notWellFormed, "line 1, column 2: a NUL");
}

TEST_F(Hostile, DocumentsThatAreNoneAreRefused) {
    for (const char* document : {"",
                                 " ",
                                 "\n",
                                 "CIM",
                                 "<",
                                 "<CIM",
                                 "<CIM>",
                                 "</CIM>",
                                 "<CIM/><CIM/>",
                                 "<CIM/>x",
                                 "<CIM></MESSAGE>",
                                 "<CIM CIMVERSION=2.0/>",
                                 "<CIM CIMVERSION/>",
                                 "<CIM CIMVERSION=\"2.0\" CIMVERSION=\"2.0\"/>",
                                 "<CIM a=\"<\"/>",
                                 "<CIM <MESSAGE/>",
                                 "<?xml?><CIM/>",
                                 " <?xml version=\"1.0\"?><CIM/>",
                                 "<!-- -- --><CIM/>",
                                 "<CIM><![CDATA[",
                                 "<CIM><!--",
                                 "<CIM><?a",
                                 "<!DOCTYPE",
                                 "<!DOCTYPE CIM \"",
                                 "<CIM/><!DOCTYPE CIM>",
                                 "<!ENTITY a \"b\"><CIM/>",
                                 "<1/>",
                                 "<CIM>]]></CIM>"}) {
        const auto refusal = refusalOf(document);
        ASSERT_TRUE(refusal) << document;
        EXPECT_EQ(refusal->kind, Kind::notWellFormed) << document << ": " << refusal->reason;
    }
}

TEST_F(Hostile, DocumentsCutOffAnywhereAreRefused) {
    const std::string document =
        "<!DOCTYPE CIM SYSTEM \"a\">" +
        withArgument("<VALUE.ARRAY><VALUE>\xE2\x82\xAC&amp;&#65;<![CDATA[<]]></VALUE><VALUE.NULL/></VALUE.ARRAY>")
            .substr(std::string("<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n").size());
    ASSERT_FALSE(refusalOf(document));
    for (std::size_t size = 0; size < document.size(); ++size) {
        const auto refusal = refusalOf(document.substr(0, size));
        ASSERT_TRUE(refusal) << size;
        EXPECT_EQ(refusal->kind, Kind::notWellFormed) << refusal->reason;
    }
}

TEST_F(Hostile, DocumentsWithChangedBytesAreReadOrRefused) {
    const std::string document =
        withArgument("<VALUE.NAMEDINSTANCE><INSTANCENAME CLASSNAME=\"A\"><KEYBINDING NAME=\"K\">"
                     "<KEYVALUE TYPE=\"uint8\">1</KEYVALUE></KEYBINDING></INSTANCENAME>"
                     "<INSTANCE CLASSNAME=\"A\"><PROPERTY NAME=\"P\" TYPE=\"real32\"><VALUE>1"
                     "</VALUE></PROPERTY></INSTANCE></VALUE.NAMEDINSTANCE>");
    std::mt19937 random(4711); // NOLINT(cert-msc51-cpp): the same every time
    const std::string alphabet = "<>/&;\"'=![]-?x \n";
    int refused = 0;
    for (int i = 0; i < 20000; ++i) {
        std::string changed = document;
        for (int changes = 0; changes < 3; ++changes) {
            changed[random() % changed.size()] = alphabet[random() % alphabet.size()];
        }
        refused += refusalOf(changed) ? 1 : 0;
    }
    EXPECT_GT(refused, 10000);
}

TEST_F(Hostile, ThreadsReadAtTheSameTime) {
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([i] {
            for (int round = 0; round < 50; ++round) {
                const std::string text = std::to_string(i * 1000 + round);
                EXPECT_EQ(std::get<cimxml::Untyped>(argumentOf("<VALUE>" + text + "</VALUE>")).text, text);
                EXPECT_TRUE(refusalOf("<CIM>" + text));
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

/** References within keys of references: 3 elements each, the innermost one 2. */
std::string nested(std::size_t references, const std::string& innermost = "") {
    const std::string begin = "<VALUE.REFERENCE><INSTANCENAME CLASSNAME=\"A\">";
    const std::string end = "</INSTANCENAME></VALUE.REFERENCE>";
    return repeat(begin + "<KEYBINDING NAME=\"K\">", references - 1) + begin + innermost + end +
           repeat("</KEYBINDING>" + end, references - 1);
}

TEST_F(Hostile, DepthIsLimited) {
    constexpr std::size_t frameDepth = 5;
    ASSERT_EQ(Limits().depth, frameDepth + 20 * 3 - 1);
    EXPECT_FALSE(refusalOf(withArgument(nested(20))));
    expectRefusal(withArgument(nested(20, "<KEYVALUE>x</KEYVALUE>")), Kind::notValid,
                  "more than 64 elements within each other");
    expectRefusal(repeat("<CIM>", 100000), Kind::notValid, "more than 64 elements within each other");
}

TEST_F(Hostile, NumberOfElementsIsLimited) {
    constexpr std::size_t frameElements = 9;
    const auto document = [](std::size_t values) {
        return withArgument("<VALUE.ARRAY>" + repeat("<VALUE/>", values) + "</VALUE.ARRAY>");
    };
    EXPECT_FALSE(refusalOf(document(Limits().elements - frameElements)));
    expectRefusal(document(Limits().elements - frameElements + 1), Kind::notValid, "more than 200000 elements");
}

TEST_F(Hostile, NumberOfAttributesIsLimited) {
    const auto document = [](std::size_t attributes) {
        std::string text;
        for (std::size_t i = 1; i < attributes; ++i) {
            text += " a" + std::to_string(i) + " = '=\"&lt;>'";
        }
        return withArgument("<CLASSNAME" + text + " NAME=\"A\"/>");
    };
    EXPECT_FALSE(refusalOf(document(Limits().attributes)));
    expectRefusal(document(Limits().attributes + 1), Kind::notValid, "line 3, column 190: more than 16 attributes");
    expectRefusal(document(300000), Kind::notValid, "more than 16 attributes of an element");
}

TEST_F(Hostile, NothingIsReadBehindWhatIsNotWellFormed) {
    // Read on, the parser would compare each of these attributes with each, for minutes.
    std::string attributes;
    for (std::size_t i = 0; i < 300000; ++i) {
        attributes += " a" + std::to_string(i) + "=''";
    }
    const auto start = std::chrono::steady_clock::now();
    expectRefusal("<CIM><? <x" + attributes + "/> ?></CIM>", Kind::notWellFormed, "line 1, column 8: xmlParsePI");
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(20));
}

TEST_F(Hostile, AttributesAreCountedInTagsOnly) {
    const std::string many = repeat(" a=\"b\"", 100);
    EXPECT_FALSE(refusalOf(withArgument("<!-- <x" + many + "> --><?p <x" + many + "?><VALUE>" + many + "<![CDATA[<x" +
                                        many + "]]></VALUE>")));
}

TEST_F(Hostile, NumberOfPropertiesIsLimited) {
    const auto instance = [](std::size_t count) {
        return "<INSTANCE CLASSNAME=\"A\">" + repeat("<PROPERTY NAME=\"P\" TYPE=\"string\"/>", count) + "</INSTANCE>";
    };
    const auto definition = [](std::size_t count) {
        return "<CLASS NAME=\"A\">" + repeat("<PROPERTY NAME=\"P\" TYPE=\"string\"/>", count) + "</CLASS>";
    };
    EXPECT_FALSE(refusalOf(withArgument(instance(Limits().properties))));
    expectRefusal(withArgument(instance(Limits().properties + 1)), Kind::notValid, "more than 1000 properties");
    EXPECT_FALSE(refusalOf(withArgument(definition(Limits().properties))));
    expectRefusal(withArgument(definition(Limits().properties + 1)), Kind::notValid, "more than 1000 properties");
}

TEST_F(Hostile, NumberOfKeysIsLimited) {
    const auto name = [](std::size_t count) {
        return "<INSTANCENAME CLASSNAME=\"A\">" + repeat("<KEYBINDING NAME=\"K\"><KEYVALUE/></KEYBINDING>", count) +
               "</INSTANCENAME>";
    };
    EXPECT_FALSE(refusalOf(withArgument(name(Limits().keys))));
    expectRefusal(withArgument(name(Limits().keys + 1)), Kind::notValid, "more than 100 keys");
}

TEST_F(Hostile, LengthOfTextsIsLimited) {
    const std::string longest(Limits().textBytes, 'x');
    EXPECT_FALSE(refusalOf(withArgument("<VALUE>" + longest + "</VALUE>")));
    expectRefusal(withArgument("<VALUE>" + longest + "x</VALUE>"), Kind::notValid,
                  "more than 1048576 bytes of a value");
    expectRefusal(withArgument("<VALUE>" + longest + "<![CDATA[x]]></VALUE>"), Kind::notValid,
                  "1048576 bytes of a value");
    EXPECT_FALSE(refusalOf(withArgument("<CLASSNAME NAME=\"" + longest + "\"/>")));
    expectRefusal(withArgument("<CLASSNAME NAME=\"" + longest + "x\"/>"), Kind::notValid,
                  "more than 1048576 bytes of an attribute");
}

/** Instances embedded in each other, so many. */
std::string embedded(std::size_t count) {
    std::string text = "<INSTANCE CLASSNAME=\"A\"/>";
    for (std::size_t i = 1; i < count; ++i) {
        std::string escaped;
        for (const char c : text) {
            escaped += c == '<' ? "&lt;" : c == '&' ? "&amp;" : std::string(1, c);
        }
        text = "<INSTANCE CLASSNAME=\"A\"><PROPERTY NAME=\"P\" TYPE=\"string\" EmbeddedObject=\"instance\"><VALUE>" +
               escaped + "</VALUE></PROPERTY></INSTANCE>";
    }
    return "<VALUE><![CDATA[" + text + "]]></VALUE>";
}

TEST_F(Hostile, DepthOfEmbeddingIsLimited) {
    const std::string attribute = " EmbeddedObject=\"instance\"";
    EXPECT_FALSE(refusalOf(withArgument(embedded(Limits().embedded), attribute)));
    expectRefusal(withArgument(embedded(Limits().embedded + 1), attribute), Kind::notLooselyValid,
                  "more than 8 embedded objects within each other");
}

TEST_F(Hostile, LimitsHoldWithinEmbeddedObjects) {
    const auto argument = [](std::size_t keys) {
        return "<VALUE><![CDATA[<INSTANCE CLASSNAME=\"A\"><PROPERTY.REFERENCE "
               "NAME=\"P\"><VALUE.REFERENCE><INSTANCENAME "
               "CLASSNAME=\"B\">" +
               repeat("<KEYBINDING NAME=\"K\"><KEYVALUE/></KEYBINDING>", keys) +
               "</INSTANCENAME></VALUE.REFERENCE></PROPERTY.REFERENCE></INSTANCE>]]></VALUE>";
    };
    Limits limits;
    limits.keys = 3;
    EXPECT_FALSE(refusalOf(withArgument(argument(3), " EmbeddedObject=\"instance\""), limits));
    expectRefusal(withArgument(argument(4), " EmbeddedObject=\"instance\""), Kind::notLooselyValid,
                  "more than 3 keys", limits);
}

} // namespace
} // namespace marlo::test
