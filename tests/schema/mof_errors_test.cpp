#include "tests/schema/Mof.h"

#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

struct WrongText {
    const char* text; ///< begins at line 2, behind the qualifier types
    const char* error;
};

void expectErrors(const std::vector<WrongText>& cases) {
    for (const WrongText& wrong : cases) {
        EXPECT_EQ(readError(Qualifiers + wrong.text), wrong.error) << wrong.text;
    }
}

TEST(MofErrors, NameWhatIsMissingFromTheGrammar) {
    expectErrors({
        {"class", "t.mof:2:6: expected the name of the class, found the end of the file"},
        {"class A", "t.mof:2:8: expected '{' and the properties of class A, found the end of the file"},
        {"class A : {};", "t.mof:2:11: expected the superclass of A, found '{'"},
        {"class A {}", "t.mof:2:11: expected ';' behind class A, found the end of the file"},
        {"class A { string; };", "t.mof:2:17: expected the name of a property or method, found ';'"},
        {"class A { string B }", "t.mof:2:20: expected ';' behind B, found '}'"},
        {"class A { string B[; };", "t.mof:2:20: expected ']' of the array, found ';'"},
        {"class A { string B = ; };", "t.mof:2:22: expected a value, found ';'"},
        {"class A { [Key string B; };", "t.mof:2:16: expected ']' behind the qualifiers, found 'string'"},
        {"class A { [MaxLen(5] string B; };",
         "t.mof:2:20: expected ')' behind the value of qualifier MaxLen, found ']'"},
        {"class A { uint32 B(; };", "t.mof:2:20: expected a type, or '}' at the end of the class, found ';'"},
        {"class A { uint32 B() };", "t.mof:2:22: expected ';' behind B, found '}'"},
        {"class A { [Values{\"a\",}] string B; };", "t.mof:2:23: expected a value, found '}'"},
        {"klass A {};", "t.mof:2:1: expected a class, a qualifier declaration or a #pragma, found 'klass'"},
        {"[Abstract] klass A {};", "t.mof:2:12: expected 'class' behind its qualifiers, found 'klass'"},
        {"#pragmatic", "t.mof:2:2: expected 'pragma' behind '#', found 'pragmatic'"},
        {"#pragma namespace root", "t.mof:2:19: expected '(' behind #pragma namespace, found 'root'"},
        {"#pragma namespace (root)", "t.mof:2:20: expected a quoted argument of #pragma namespace, found 'root'"},
        {"#pragma namespace (\"/\")", "t.mof:2:20: expected the name of a namespace, found \"/\""},
        {"#pragma namespace (\"//far/root\")",
         "t.mof:2:20: a namespace of another host cannot be declared here: \"//far/root\""},
        {"instance of A {};", "t.mof:2:1: instances are not read here: a schema holds classes and qualifiers"},
    });
}

TEST(MofErrors, NameWhatIsWrongWithAToken) {
    expectErrors({
        {"class A { string B = \"open;\n };", "t.mof:2:22: this string is not closed on its line"},
        {"class A { string B = \"\\q\"; };", "t.mof:2:23: an escape that MOF has not: \\q"},
        {"class A { string B = \"\\x\"; };",
         "t.mof:2:23: one to four hexadecimal digits, not all zero, belong behind \\x"},
        {"class A { string B = \"\\x0\"; };",
         "t.mof:2:23: one to four hexadecimal digits, not all zero, belong behind \\x"},
        {"class A { string B = \"\xE4\"; };", "t.mof:2:23: a byte that is no UTF-8"},
        {"class A\xFF {};", "t.mof:2:8: a byte that is no UTF-8"},
        {"\n\n /* never\n closed", "t.mof:4:2: this comment is not closed"},
        {"class A { uint8 B = 08; };", "t.mof:2:21: not a number: '08'"},
        {"class A { uint8 B = 2b; };", "t.mof:2:21: not a number: '2b'"},
        {"class A { uint8 B = 0x; };", "t.mof:2:21: not a number: '0x'"},
        {"class A { uint8 B = 1km; };", "t.mof:2:21: not a number: '1km'"},
        {"class A { real32 B = 1.2.3; };", "t.mof:2:22: not a number: '1.2.3'"},
        {"class A { uint64 B = 18446744073709551616; };",
         "t.mof:2:22: an integer of more than 64 bits: '18446744073709551616'"},
        {"class A { char16 B = ''; };", "t.mof:2:22: a character is one UCS-2 character between single quotes"},
        {"class A { char16 B = 'ab'; };", "t.mof:2:22: a character is one UCS-2 character between single quotes"},
        {"class A { string B = %; };", "t.mof:2:22: a character that MOF has no use for: '%'"},
        {"class A { \x01 };", "t.mof:2:11: a character that MOF has no use for: byte 0x01"},
    });
}

TEST(MofErrors, CountColumnsInCharactersAndLinesInAnyLayout) {
    expectErrors({
        {"/* \xC3\xA4\xC3\xB6 */ klass",
         "t.mof:2:10: expected a class, a qualifier declaration or a #pragma, found 'klass'"},
        {"// a\r\n\t klass", "t.mof:3:3: expected a class, a qualifier declaration or a #pragma, found 'klass'"},
        {"/* a\n b */ klass", "t.mof:3:7: expected a class, a qualifier declaration or a #pragma, found 'klass'"},
    });
}

TEST(MofErrors, RefuseWrongClasses) {
    expectErrors({
        {"class A : Nowhere {};", "t.mof:2:11: superclass Nowhere of A is not declared"},
        {"class A : A {};", "t.mof:2:11: class A derives from itself"},
        {"class A : B {};\nclass B : C {};\nclass C : A {};", "t.mof:2:11: class A derives from itself"},
        {"class A {};\nclass a {};", "t.mof:3:7: class a is declared already, at t.mof:2"},
        {"class A { string B; uint8 b; };", "t.mof:2:27: class A has b already"},
        {"class A { string B; uint8 B(); };", "t.mof:2:27: class A has B already"},
        {"class A { strin B; };", "t.mof:2:11: 'strin' is no CIM type; a reference is written strin REF"},
        {"class A { B REF C; };", "t.mof:2:11: class A refers to class B, which is not declared"},
        {"class A { uint8 M(B REF C); };", "t.mof:2:19: class A refers to class B, which is not declared"},
        {"class A { uint8 M(string B, string b); };", "t.mof:2:36: method A.M has a parameter b already"},
        {"class A { [Key] string B[]; };", "t.mof:2:24: property A.B is an array and cannot be a key"},
        {"class A { [Key] string B; };\nclass C : A { [Key] string D; };",
         "t.mof:3:28: class C inherits its keys from A: D cannot be a further one"},
    });
}

TEST(MofErrors, RefuseWrongQualifiers) {
    expectErrors({
        {"[Unheard] class A {};", "t.mof:2:2: qualifier Unheard of class A is not declared"},
        {"class A { [Unheard] string B; };", "t.mof:2:12: qualifier Unheard of property A.B is not declared"},
        {"[Key] class A {};", "t.mof:2:2: qualifier Key is for property, reference, not for class A"},
        {"class A { [Abstract] string B; };",
         "t.mof:2:12: qualifier Abstract is for class, association, indication, not for property A.B"},
        {"class A { uint8 M([Key] string P); };",
         "t.mof:2:20: qualifier Key is for property, reference, not for parameter A.M.P"},
        {"class A { [MaxLen(\"5\")] string B; };", "t.mof:2:19: qualifier MaxLen is of type uint32, not a string"},
        {"class A { [MaxLen(-1)] string B; };", "t.mof:2:19: qualifier MaxLen is out of the range of uint32"},
        {"class A { [MaxLen{5}] string B; };", "t.mof:2:18: qualifier MaxLen is of type uint32, not an array"},
        {"class A { [Values(\"a\")] string B; };",
         "t.mof:2:19: qualifier Values is of type string[]: its values belong in braces"},
        {"class A { [Values{\"a\", 1}] string B; };",
         "t.mof:2:24: an element of qualifier Values is of type string, not an integer"},
        {"class A { [Key, key] string B; };", "t.mof:2:17: property A.B has qualifier key already"},
        {"[Description(\"a\"): Restricted ToSubclass] class A {};",
         "t.mof:2:31: flavor ToSubclass contradicts the one before it"},
        {"[Description(\"a\"): Loud] class A {};", "t.mof:2:20: 'Loud' is no flavor of a qualifier"},
        {"Qualifier Key : boolean, Scope(any);", "t.mof:2:11: qualifier Key is declared already"},
        {"Qualifier Q : wrong, Scope(any);", "t.mof:2:15: expected the type of qualifier Q, found 'wrong'"},
        {"Qualifier Q : boolean;", "t.mof:2:22: expected ',' and the scope of qualifier Q, found ';'"},
        {"Qualifier Q : boolean = 5, Scope(any);",
         "t.mof:2:25: the default of qualifier Q is of type boolean, not an integer"},
        {"Qualifier Q : boolean, Scope(everything);", "t.mof:2:30: 'everything' is no scope of a qualifier"},
    });
}

TEST(MofErrors, RefuseWrongOverrides) {
    const std::string base = "class A { string B; uint8 M(string P); [Key] string K; };\n";
    const std::vector<WrongText> cases = {
        {"class C : A { string B; };",
         "t.mof:3:22: C.B is inherited from A: it takes its place only with Override(\"B\")"},
        {"class C : A { [Override(\"B\")] uint8 B; };",
         "t.mof:3:31: property C.B is of type uint8, but overrides one of string of class A"},
        {"class C : A { [Override(\"B\")] string B[]; };",
         "t.mof:3:31: property C.B is of type string[], but overrides one of string of class A"},
        {"class C : A { [Override(\"B\")] string D; };",
         "t.mof:3:38: C.D overrides \"B\", which is not the inherited element of its name"},
        {"class C : A { [Override(\"D\")] string D; };",
         "t.mof:3:38: C.D overrides \"D\", which is not the inherited element of its name"},
        {"class C : A { [Override(\"M\")] uint8 M(uint8 P); };",
         "t.mof:3:31: method C.M has not the type and parameters of the one of class A that it overrides"},
        {"class C : A { [Override(\"M\")] string M(string P); };",
         "t.mof:3:31: method C.M has not the type and parameters of the one of class A that it overrides"},
        {"class C : A { [Override(\"M\")] uint8 M(); };",
         "t.mof:3:31: method C.M has not the type and parameters of the one of class A that it overrides"},
        {"class C : A { [Override(\"K\"), Key(false)] string K; };",
         "t.mof:3:31: property C.K inherits another value of qualifier Key, which cannot be overridden"},
    };
    for (const WrongText& wrong : cases) {
        EXPECT_EQ(readError(Qualifiers + base + wrong.text), wrong.error) << wrong.text;
    }
}

TEST(MofErrors, RefuseAReferenceThatWidensTheOneItOverrides) {
    EXPECT_EQ(readError(Qualifiers + "class A {}; class B : A {}; [Association] class R { B REF X; };\n"
                                     "[Association] class S : R { [Override(\"X\")] A REF X; };"),
              "t.mof:3:45: property S.X overrides a reference to B, which A does not derive from");
}

TEST(MofErrors, RefuseDefaultsOfAnotherType) {
    expectErrors({
        {"class A { uint8 B = 256; };", "t.mof:2:21: the default of property A.B is out of the range of uint8"},
        {"class A { uint8 B = -1; };", "t.mof:2:21: the default of property A.B is out of the range of uint8"},
        {"class A { sint8 B = 128; };", "t.mof:2:21: the default of property A.B is out of the range of sint8"},
        {"class A { sint8 B = -129; };", "t.mof:2:21: the default of property A.B is out of the range of sint8"},
        {"class A { sint64 B = 9223372036854775808; };",
         "t.mof:2:22: the default of property A.B is out of the range of sint64"},
        {"class A { string B = 5; };", "t.mof:2:22: the default of property A.B is of type string, not an integer"},
        {"class A { boolean B = \"true\"; };",
         "t.mof:2:23: the default of property A.B is of type boolean, not a string"},
        {"class A { uint8 B = 1.5; };",
         "t.mof:2:21: the default of property A.B is of type uint8, not a real number"},
        {"class A { uint8 B = 'a'; };", "t.mof:2:21: the default of property A.B is of type uint8, not a character"},
        {"class A { uint8 B[] = 1; };",
         "t.mof:2:23: the default of property A.B is of type uint8[]: its values belong in braces"},
        {"class A { uint8 B = {1}; };", "t.mof:2:21: the default of property A.B is of type uint8, not an array"},
        {"class A { datetime B = \"yesterday\"; };",
         "t.mof:2:24: the default of property A.B is no date-time: \"yesterday\""},
        {"class A { datetime B = \"20250102030405.000000:060\"; };",
         "t.mof:2:24: the default of property A.B is no date-time: \"20250102030405.000000:060\""},
    });
}

} // namespace
} // namespace marlo::test
