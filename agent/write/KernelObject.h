/**
 * @file
 * Addresses and routes in the kernel's own description.
 */
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include <linux/if_addr.h>
#include <linux/rtnetlink.h>

struct nlmsghdr;

namespace Orv::Agent::Linux {

/** The attribute of this type among attributes one behind the other; empty when there is none. */
std::span<std::uint8_t> findAttribute(std::span<std::uint8_t> attributes, std::uint16_t type);

/**
 * The payload of an rtnetlink message: a header (struct ifaddrmsg, struct rtmsg) and attributes. Kept whole, so that
 * an object that is put back has every attribute that it had, those included that nothing here knows.
 */
class KernelObject {
  public:
    /** Copies the payload of a message that carries at least a header of this many bytes, a multiple of four. */
    KernelObject(const nlmsghdr& message, std::size_t headerBytes);

    /** An object without attributes. */
    template <typename Header>
    explicit KernelObject(const Header& header)
        : _bytes(reinterpret_cast<const std::uint8_t*>(&header),
                 reinterpret_cast<const std::uint8_t*>(&header) + sizeof(Header)),
          _headerBytes(sizeof(Header)) {}

    [[nodiscard]] const std::vector<std::uint8_t>& bytes() const { return _bytes; }

    /** The payload of an attribute; empty when there is none. Valid until the object changes. */
    [[nodiscard]] std::span<std::uint8_t> attribute(std::uint16_t type);
    [[nodiscard]] std::span<const std::uint8_t> attribute(std::uint16_t type) const;

    [[nodiscard]] bool has(std::uint16_t type) const { return !attribute(type).empty(); }

    /** A number in host order. */
    [[nodiscard]] std::optional<std::uint32_t> number(std::uint16_t type) const;

    void set(std::uint16_t type, std::span<const std::uint8_t> payload);
    void set(std::uint16_t type, std::uint32_t number);
    void remove(std::uint16_t type);

    bool operator==(const KernelObject&) const = default;

  protected:
    template <typename Header>
    [[nodiscard]] Header& header() {
        return *reinterpret_cast<Header*>(_bytes.data());
    }

    template <typename Header>
    [[nodiscard]] const Header& header() const {
        return *reinterpret_cast<const Header*>(_bytes.data());
    }

  private:
    std::vector<std::uint8_t> _bytes;
    std::size_t _headerBytes;
};

/** An IPv4 address of an interface. */
class AddressObject : public KernelObject {
  public:
    /** Takes a message of the kernel's, without the times at which it was made and changed. */
    explicit AddressObject(const nlmsghdr& message);

    /** A new one of global scope that stays for good; `local` and `broadcast` in host order, 0: no broadcast. */
    AddressObject(int index, std::uint32_t local, std::uint8_t prefixLength, std::uint32_t broadcast);

    /** The interface's own address in host order. */
    [[nodiscard]] std::uint32_t local() const;

    [[nodiscard]] std::uint8_t prefixLength() const { return header<ifaddrmsg>().ifa_prefixlen; }

    [[nodiscard]] std::uint8_t scope() const { return header<ifaddrmsg>().ifa_scope; }

    [[nodiscard]] std::uint32_t flags() const;

    [[nodiscard]] bool isSecondary() const { return (flags() & IFA_F_SECONDARY) != 0; }

    [[nodiscard]] bool isPermanent() const { return (flags() & IFA_F_PERMANENT) != 0; }

    /** Whether both are the same for the kernel: own address, other end and prefix length. */
    [[nodiscard]] bool isSame(const AddressObject& other) const;

    /** Whether the kernel makes the later of the two a secondary of the other. */
    [[nodiscard]] bool sharesNetwork(const AddressObject& other) const;

    /** Has it stay for good, as no lease does. */
    void makePermanent();

  private:
    /** The address that the prefix belongs to: the other end of a point-to-point address. */
    [[nodiscard]] std::uint32_t peer() const;
};

/** An IPv4 route. */
class RouteObject : public KernelObject {
  public:
    /** Takes a message of the kernel's, without what only the kernel may say: counters, and flags of its own. */
    explicit RouteObject(const nlmsghdr& message);

    /** A new default route of the main table by this gateway, which is taken to be on the link. */
    RouteObject(int index, std::uint32_t gateway, std::uint32_t metric);

    [[nodiscard]] bool isDefault() const;
    [[nodiscard]] std::uint32_t table() const;

    [[nodiscard]] std::uint8_t protocol() const { return header<rtmsg>().rtm_protocol; }

    [[nodiscard]] std::uint8_t type() const { return header<rtmsg>().rtm_type; }

    [[nodiscard]] std::uint32_t metric() const { return number(RTA_PRIORITY).value_or(0); }

    /** Whether packets leave by the interface, or some of them. */
    [[nodiscard]] bool usesInterface(int index) const;

    /** Whether another interface carries some of the packets. */
    [[nodiscard]] bool usesOthers(int index) const;

    /** The gateway on the interface in host order; none when it has none, or an IPv6 one. */
    [[nodiscard]] std::optional<std::uint32_t> gateway(int index) const;

    /** Exchanges the gateway on the interface and keeps the rest. False when it has none to exchange. */
    bool setGateway(int index, std::uint32_t gateway);

    /** The source address that the route prefers, in host order; none when it has none. */
    [[nodiscard]] std::optional<std::uint32_t> source() const;
    void setSource(std::uint32_t address);

    /** Has the kernel take the gateway to be on the link, whatever the addresses say. */
    void assumeOnLink() { header<rtmsg>().rtm_flags |= RTNH_F_ONLINK; }

  private:
    void clean();
};

/** What the kernel has for IPv4 on one interface, in its own order. */
struct InterfaceTables {
    int index = 0;
    std::vector<AddressObject> addresses;
    std::vector<RouteObject> routes; ///< unicast, of all tables, but not those that the kernel makes itself

    bool operator==(const InterfaceTables&) const = default;
};

} // namespace Orv::Agent::Linux
