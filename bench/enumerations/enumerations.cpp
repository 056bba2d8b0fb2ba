// EnumInstances of each class through the whole object manager, and how it grows with the number of adapters.
#include "bench/support/DescribedHost.h"
#include "host/cimom/ObjectManager.h"

#include <string>

#include <benchmark/benchmark.h>

namespace marlo::bench {

namespace {

void enumerate(benchmark::State& state, const char* className) {
    const auto adapters = static_cast<long>(state.range(0));
    const DescribedHost host(static_cast<int>(adapters));
    ObjectManager manager({{MARLO_SHARE_DIRECTORY "/schema"},
                           {MARLO_SHARE_DIRECTORY "/providers"},
                           MARLO_LIBRARY_DIRECTORY,
                           {},
                           false});
    const auto request = [&] {
        long count = 0;
        const Status status =
            manager.enumerateInstances("root/tavis", className, {}, [&count](Instance&&) { ++count; });
        if (!status.ok() || count != adapters) {
            state.SkipWithError(("not every adapter was answered: " + status.message).c_str());
        }
    };
    request(); // reads the description, which an enumeration of adapters that have not changed does not
    for (auto _ : state) {
        request();
    }
    state.SetItemsProcessed(state.iterations() * adapters);
}

BENCHMARK_CAPTURE(enumerate, Configuration, "MARLO_NetworkAdapterConfiguration")
    ->Arg(1000)
    ->Arg(10000)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(enumerate, Logical, "MARLO_LogicalNetworkAdapter")
    ->Arg(1000)
    ->Arg(10000)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(enumerate, Physical, "MARLO_PhysicalNetworkAdapter")
    ->Arg(1000)
    ->Arg(10000)
    ->Unit(benchmark::kMicrosecond);

} // namespace

} // namespace marlo::bench

BENCHMARK_MAIN();
