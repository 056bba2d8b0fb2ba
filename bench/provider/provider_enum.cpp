// EnumInstances of the configuration class: the provider against a floor that makes the same calls in a flat loop.
#include "bench/provider/ProviderBench.h"
#include "bench/support/DescribedHost.h"

#include <benchmark/benchmark.h>

namespace marlo::bench {

namespace {

constexpr const char* NAME_SPACE = "root/tavis";
constexpr const char* CLASS = "MARLO_NetworkAdapterConfiguration";

/** Runs `call` once per iteration as an object manager would: in a scope, with a context, a result and a path. */
template <typename Call>
void measure(benchmark::State& state, Call call) {
    const auto adapters = static_cast<int>(state.range(0));
    const DescribedHost host(adapters);
    const broker::Broker& broker = sharedBroker();
    for (auto _ : state) {
        const broker::CallScope scope;
        CountingSink sink;
        const broker::Result result(sink);
        const CMPIContext* context = broker.newContext();
        const CMPIObjectPath* reference = broker.newObjectPath({"", NAME_SPACE, CLASS, {}});
        call(broker, context, result.handle(), reference);
        if (sink.count != adapters) {
            state.SkipWithError("not every adapter was answered");
        }
    }
    state.SetItemsProcessed(state.iterations() * adapters);
}

void provider(benchmark::State& state) {
    CMPIInstanceMI* mi = configurationProvider();
    measure(state, [mi](const broker::Broker& /*broker*/, const CMPIContext* context, const CMPIResult* result,
                        const CMPIObjectPath* reference) {
        (void)mi->ft->enumerateInstances(mi, context, result, reference, nullptr);
    });
}

void floor(benchmark::State& state) {
    measure(state, [](const broker::Broker& broker, const CMPIContext* /*context*/, const CMPIResult* result,
                      const CMPIObjectPath* reference) { enumerateFlat(broker.handle(), result, reference); });
}

BENCHMARK(provider)->Arg(4)->Arg(64)->Arg(1000)->Arg(10000)->Unit(benchmark::kMicrosecond);
BENCHMARK(floor)->Arg(4)->Arg(64)->Arg(1000)->Arg(10000)->Unit(benchmark::kMicrosecond);

} // namespace

} // namespace marlo::bench

BENCHMARK_MAIN();
