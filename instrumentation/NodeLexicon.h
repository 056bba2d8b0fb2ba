/**
 * @file
 * The vocabulary of the instrumentation tree: node types and node properties.
 *
 * The numbers are part of the interface to the agent library, which receives them as plain integers. Numbers in
 * between belong to other parts of the agent's vocabulary.
 */
#pragma once

namespace Orv::NodeLexicon {

/** Type of a node of the instrumentation tree. */
enum NodeType : int {
    NODE_NETWORK_PORT = 12,    ///< a physical port: identity string and MAC address
    NODE_NETWORK_ADAPTER = 29, ///< a network interface and its IP configuration
};

/** Property of a node; each has one value type. A node may lack any of them. */
enum Properties : int {
    PROP_DHCP_ENABLED = 24,     ///< unsigned int: address assignment, 1 = DHCP, 3 = static
    PROP_IPV4_ADDRESS = 25,     ///< string, dotted form
    PROP_IPV4_SUBNET_MASK = 26, ///< string, dotted form
    PROP_IPV6_ADDRESS = 27,     ///< string, RFC 5952 form
    PROP_DNS_SERVERS = 94,      ///< list of strings: addresses in search order
    PROP_IP_SUPPORT = 96,       ///< unsigned int: IP support code
    PROP_DNS_HOSTNAME = 97,     ///< string
    PROP_DNS_DOMAIN = 98,       ///< string
    PROP_DNS_SUFFIXES = 99,     ///< list of strings: suffixes to append, in order
    PROP_DEFAULT_GATEWAY = 100, ///< string: one address
    PROP_NODE_STRING = 108,     ///< string: the node's identity
    PROP_MAC_ADDRESS = 121,     ///< string: six or more octets, hexadecimal, separated by colons
    PROP_STATUS = 123,          ///< unsigned int: 1 = up and running, 5 = stopped, 12 = lost communication
};

} // namespace Orv::NodeLexicon
