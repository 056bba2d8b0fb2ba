// Writing the answer to EnumerateInstances: our writer against the XML library's, which writes the same bytes.
#include "bench/xml/LibraryWriter.h"
#include "host/cimxml/Message.h"
#include "host/cimxml/Writer.h"

#include <benchmark/benchmark.h>

namespace marlo::bench {

namespace {

constexpr int propertyCount = 30;

Value exampleValue(int number) {
    switch (number % 6) {
    case 0:
        return Value::uint(CMPI_uint16, 5);
    case 1:
        return Value::boolean(true);
    case 2:
        return {CMPI_stringA, Value::Array{Value::string("192.0.2.10"), Value::string("2001:db8::10")}};
    case 3:
        return {CMPI_dateTime, DateTime{"20240101000000.000000+000"}};
    default:
        return Value::string("example.com & <sons>");
    }
}

/** 30 properties of the kinds that adapters have. */
Class exampleClass() {
    Class definition;
    definition.name = "EXAMPLE_NetworkAdapterConfiguration";
    for (int i = 0; i < propertyCount; ++i) {
        Property property;
        property.name = "PropertyOfAnAdapter" + std::to_string(i);
        property.type = exampleValue(i).type;
        property.origin = definition.name;
        definition.properties.push_back(property);
    }
    return definition;
}

std::vector<Instance> exampleInstances(const Class& definition, std::int64_t count) {
    Instance instance;
    for (int i = 0; i < propertyCount; ++i) {
        instance.properties.push_back({definition.properties[static_cast<std::size_t>(i)].name, exampleValue(i)});
    }
    std::vector<Instance> instances;
    for (std::int64_t i = 0; i < count; ++i) {
        instance.path = {
            "", "root/example", definition.name, {{"SettingID", Value::string("eth" + std::to_string(i))}}};
        instances.push_back(instance);
    }
    return instances;
}

/** Writes to a sink that only counts, as one that hands on to the network copies nothing either. */
void write(const std::vector<Instance>& instances, const Class& definition, const cimxml::Writer::Sink& sink) {
    cimxml::Writer writer(sink, "host.example");
    writer.beginIntrinsic("1", "EnumerateInstances");
    writer.beginReturnValue();
    for (const Instance& instance : instances) {
        writer.instance(instance, cimxml::Wrap::namedInstance, &definition, {});
    }
    writer.endReturnValue();
    writer.endIntrinsic();
    writer.finish();
}

void writer(benchmark::State& state) {
    const Class definition = exampleClass();
    const auto instances = exampleInstances(definition, state.range(0));
    std::string document;
    write(instances, definition, [&document](std::string_view piece) { document += piece; });
    if (document != writeByLibrary(instances)) {
        state.SkipWithError("the documents differ");
    }
    std::size_t bytes = 0;
    for (auto _ : state) {
        write(instances, definition, [&bytes](std::string_view piece) { bytes += piece.size(); });
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

void library(benchmark::State& state) {
    const auto instances = exampleInstances(exampleClass(), state.range(0));
    std::size_t bytes = 0;
    for (auto _ : state) {
        bytes += writeByLibrary(instances).size();
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(bytes));
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

/** A request as management stations send it. */
void reader(benchmark::State& state) {
    const std::string request =
        "<?xml version=\"1.0\" encoding=\"utf-8\" ?>\n<CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE "
        "ID=\"1001\" "
        "PROTOCOLVERSION=\"1.0\"><SIMPLEREQ><IMETHODCALL NAME=\"GetInstance\"><LOCALNAMESPACEPATH><NAMESPACE "
        "NAME=\"root\"/>"
        "<NAMESPACE NAME=\"example\"/></LOCALNAMESPACEPATH><IPARAMVALUE NAME=\"InstanceName\"><INSTANCENAME "
        "CLASSNAME=\"EXAMPLE_NetworkAdapterConfiguration\"><KEYBINDING NAME=\"SettingID\"><KEYVALUE "
        "VALUETYPE=\"string\">"
        "eth0</KEYVALUE></KEYBINDING></INSTANCENAME></IPARAMVALUE><IPARAMVALUE "
        "NAME=\"LocalOnly\"><VALUE>FALSE</VALUE>"
        "</IPARAMVALUE></IMETHODCALL></SIMPLEREQ></MESSAGE></CIM>";
    for (auto _ : state) {
        benchmark::DoNotOptimize(cimxml::readMessage(request));
    }
    state.SetItemsProcessed(state.iterations());
}

BENCHMARK(writer)->Arg(1)->Arg(64)->Arg(1000)->Unit(benchmark::kMicrosecond);
BENCHMARK(library)->Arg(1)->Arg(64)->Arg(1000)->Unit(benchmark::kMicrosecond);
BENCHMARK(reader)->Unit(benchmark::kMicrosecond);

} // namespace

} // namespace marlo::bench

BENCHMARK_MAIN();
