/**
 * @file
 * Adapters for the description of a host, as its file has them.
 */
#pragma once

namespace marlo::test {

/** An adapter between the host and its own management controller, which is no adapter of the host's. */
inline constexpr const char* controllerAdapter = R"([[adapter]]
identity = "usb0"
chassis = "BMC"
dhcp = 3
ipv4_address = "198.51.100.2"
ipv4_subnet_mask = "255.255.255.0"

)";

/** Of an adapter that works and has every property; its identity and device stand before. */
inline constexpr const char* uplinkProperties = R"(description = "Uplink"
status = 1
dhcp = 3
ip_support = 3
ipv4_address = "192.0.2.10"
ipv4_subnet_mask = "255.255.255.0"
ipv6_address = "2001:db8:0:2::10"
default_gateway = "192.0.2.1"
dns_servers = ["192.0.2.53", "2001:db8:0:2::53"]
dns_suffixes = ["lab.example.org", "example.org"]
dns_hostname = "lab"
dns_domain = "lab.example.org"
mac_address = "02:00:5e:10:00:01"

)";

} // namespace marlo::test
