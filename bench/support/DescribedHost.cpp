#include "bench/support/DescribedHost.h"

#include "instrumentation/Instrumentation.h"

#include <cstdlib>
#include <fstream>
#include <stdexcept>

#include <unistd.h>

namespace marlo::bench {

namespace {

void describeAdapter(std::ostream& out, int number) {
    out << "[[adapter]]\nidentity = \"eth" << number << "\"\nstatus = 1\ndhcp = 3\nip_support = 3\n"
        << "ipv4_address = \"10." << number / 62500 << '.' << number / 250 % 250 << '.' << number % 250 + 1 << "\"\n"
        << "ipv4_subnet_mask = \"255.0.0.0\"\nipv6_address = \"2001:db8::" << std::hex << number + 1 << std::dec
        << "\"\ndefault_gateway = \"10.255.255.254\"\ndns_servers = [\"192.0.2.53\", \"198.51.100.53\"]\n"
        << "dns_suffixes = [\"example.com\", \"example.net\"]\ndns_hostname = \"host\"\n"
        << "dns_domain = \"example.com\"\nmac_address = \"02:00:00:00:00:01\"\n";
}

} // namespace

DescribedHost::DescribedHost(int adapters) : _path("/tmp/marlo-bench-" + std::to_string(::getpid()) + ".toml") {
    std::ofstream file(_path, std::ios::trunc);
    for (int i = 0; i < adapters; ++i) {
        describeAdapter(file, i);
    }
    file.close();
    if (!file) {
        throw std::runtime_error("cannot write " + _path);
    }
    (void)::setenv("ORV_AGENT_TREE", _path.c_str(), 1);
    const Orv::Instrumentation warm;
}

DescribedHost::~DescribedHost() {
    (void)::unlink(_path.c_str());
}

} // namespace marlo::bench
