/** @file What is written, byte by byte. */
#include "host/cimxml/Writer.h"

#include <gtest/gtest.h>

namespace marlo::test {
namespace {

using cimxml::PathWrap;
using cimxml::Wrap;
using cimxml::Writer;

/** What a writer writes of one thing. */
template <typename Write>
std::string written(Write write) {
    std::string document;
    Writer writer([&document](std::string_view piece) { document += piece; }, "host.example");
    write(writer);
    writer.finish();
    return document;
}

TEST(Writer, FramesAnIntrinsicAnswer) {
    EXPECT_EQ(written([](Writer& writer) {
                  writer.beginIntrinsic("<4711>", "GetClass");
                  writer.beginReturnValue();
                  writer.endReturnValue();
                  writer.outParameter({"EndOfSequence", Value::boolean(true)});
                  writer.endIntrinsic();
              }),
              "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n"
              "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"&lt;4711&gt;\" PROTOCOLVERSION=\"1.0\">"
              "<SIMPLERSP><IMETHODRESPONSE NAME=\"GetClass\"><IRETURNVALUE></IRETURNVALUE>"
              "<PARAMVALUE NAME=\"EndOfSequence\" PARAMTYPE=\"boolean\"><VALUE>TRUE</VALUE></PARAMVALUE>"
              "</IMETHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n");
}

TEST(Writer, FramesAnExtrinsicAnswer) {
    EXPECT_EQ(
        written([](Writer& writer) {
            writer.beginExtrinsic("1", "Reset");
            writer.returnValue(Value::uint(CMPI_uint32, 5));
            writer.outParameter({"Job", Value{CMPI_ref, std::make_shared<const ObjectPath>(ObjectPath{
                                                            "", "root", "A", {{"K", Value::boolean(true)}}})}});
            writer.endExtrinsic();
        }),
        "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n"
        "<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" PROTOCOLVERSION=\"1.0\">"
        "<SIMPLERSP><METHODRESPONSE NAME=\"Reset\"><RETURNVALUE PARAMTYPE=\"uint32\"><VALUE>5</VALUE></RETURNVALUE>"
        "<PARAMVALUE NAME=\"Job\" PARAMTYPE=\"reference\"><VALUE.REFERENCE><LOCALINSTANCEPATH><LOCALNAMESPACEPATH>"
        "<NAMESPACE NAME=\"root\"/></LOCALNAMESPACEPATH><INSTANCENAME CLASSNAME=\"A\"><KEYBINDING NAME=\"K\">"
        "<KEYVALUE VALUETYPE=\"boolean\" "
        "TYPE=\"boolean\">TRUE</KEYVALUE></KEYBINDING></INSTANCENAME></LOCALINSTANCEPATH>"
        "</VALUE.REFERENCE></PARAMVALUE></METHODRESPONSE></SIMPLERSP></MESSAGE></CIM>\n");
}

TEST(Writer, WritesErrors) {
    EXPECT_EQ(written([](Writer& writer) { writer.error(6, "no \"such\"\nthing"); }),
              "<ERROR CODE=\"6\" DESCRIPTION=\"no &quot;such&quot;&#10;thing\"/>");
}

} // namespace
} // namespace marlo::test
