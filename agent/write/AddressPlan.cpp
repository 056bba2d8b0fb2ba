#include "agent/write/AddressPlan.h"

#include "agent/write/KernelWriter.h"

#include <algorithm>

#include <linux/netlink.h>

namespace Orv::Agent::Linux {

namespace {

constexpr std::uint8_t hostPrefix = 32;

/** From this length on a network has no broadcast address (RFC 3021). */
constexpr std::uint8_t firstWithoutBroadcast = 31;

std::string shown(const AddressObject& address) {
    return Ipv4Prefixed{{address.local()}, address.prefixLength()}.text();
}

void addStep(ChangeBatch& steps, const AddressObject& address) {
    steps.add(RTM_NEWADDR, NLM_F_CREATE | NLM_F_REPLACE, address, "adding the address " + shown(address));
}

void removeStep(ChangeBatch& steps, const AddressObject& address) {
    steps.add(RTM_DELADDR, 0, address, "removing the address " + shown(address));
}

AddressObject makeAddress(const InterfaceTables& before, const Ipv4Prefixed& wanted, const AddressObject* old) {
    const bool broadcasts = wanted.prefixLength < firstWithoutBroadcast;
    AddressObject fresh(before.index, wanted.address.number, wanted.prefixLength,
                        broadcasts ? wanted.broadcast().number : 0);
    if (old != nullptr && old->isPermanent() && old->has(IFA_RT_PRIORITY)) {
        fresh.set(IFA_RT_PRIORITY, old->attribute(IFA_RT_PRIORITY));
    }
    return fresh;
}

/** Finds the one that is the same for the kernel. */
const AddressObject* findSame(const std::vector<AddressObject>& addresses, const AddressObject& wanted) {
    const auto found = std::find_if(addresses.begin(), addresses.end(),
                                    [&](const AddressObject& one) { return one.isSame(wanted); });
    return found == addresses.end() ? nullptr : &*found;
}

bool sharesNetworkWithAny(const std::vector<AddressObject>& addresses, const AddressObject& wanted) {
    return std::any_of(addresses.begin(), addresses.end(),
                       [&](const AddressObject& one) { return one.sharesNetwork(wanted); });
}

/** Whether an address would come before a new one of global scope, or goes with one that leaves. */
bool mustMove(const AddressObject& address, const AddressObject* fresh, const AddressObject* old) {
    const bool sharesOld = old != nullptr && address.sharesNetwork(*old);
    const bool precedes = fresh != nullptr && (address.scope() == RT_SCOPE_UNIVERSE || address.sharesNetwork(*fresh));
    return sharesOld || precedes;
}

/** The last comes first: secondaries stand behind their primary, which then takes none with it. */
void removeAll(ChangeBatch& steps, const std::vector<AddressObject>& addresses) {
    std::for_each(addresses.rbegin(), addresses.rend(),
                  [&](const AddressObject& address) { removeStep(steps, address); });
}

/**
 * Exchanges `leaving` for `fresh` and what comes back. While addresses of the new one's own network are there it
 * would be a secondary; so it stands by as a host address, for the interface not to lose its last address and with
 * that all its routes.
 */
void exchange(AddressPlan& plan, const InterfaceTables& before, const std::vector<AddressObject>& leaving,
              const AddressObject& fresh) {
    AddressObject standIn(before.index, fresh.local(), hostPrefix, 0);
    const bool needsStandIn = sharesNetworkWithAny(leaving, fresh);
    const bool standsAlready = findSame(before.addresses, standIn) != nullptr;
    plan.isGapless = !standsAlready;
    if (!needsStandIn) {
        addStep(plan.steps, fresh);
    } else if (!standsAlready) {
        addStep(plan.steps, standIn);
    }
    removeAll(plan.steps, leaving);
    if (needsStandIn) {
        addStep(plan.steps, fresh);
    }
    if (needsStandIn && !standsAlready) {
        removeStep(plan.steps, standIn);
    }
}

/** Has the address that stands for the interface already stay for good. */
AddressPlan keep(const InterfaceTables& before, std::size_t place) {
    AddressPlan plan{{}, before.addresses, true};
    AddressObject& present = plan.result[place];
    if (!present.isPermanent()) {
        present.makePermanent();
        addStep(plan.steps, present);
    }
    return plan;
}

/** Whether an address goes for good; the arguments are those of exchangeFor(). */
bool goes(const AddressObject& address, const AddressObject* old, bool endLeases) {
    return &address == old || (endLeases && !address.isPermanent());
}

/** Has `fresh`, or nothing, in the place of `old`, which is one of those in `before` or null. */
AddressPlan exchangeFor(const InterfaceTables& before, const AddressObject* fresh, const AddressObject* old,
                        bool endLeases) {
    std::vector<AddressObject> leaving;
    std::vector<AddressObject> returning;
    AddressPlan plan;
    for (const AddressObject& address : before.addresses) {
        const bool replaced = goes(address, old, endLeases) || (fresh != nullptr && address.isSame(*fresh));
        const bool moves = !replaced && mustMove(address, fresh, old);
        if (replaced || moves) {
            leaving.push_back(address);
        } else {
            plan.result.push_back(address);
        }
        if (moves) {
            returning.push_back(address);
        }
    }
    if (fresh != nullptr) {
        exchange(plan, before, leaving, *fresh);
        plan.result.push_back(*fresh);
    } else {
        removeAll(plan.steps, leaving);
        plan.isGapless = false;
    }
    for (const AddressObject& address : returning) {
        addStep(plan.steps, address);
        plan.result.push_back(address);
    }
    return plan;
}

} // namespace

AddressPlan planAddress(const InterfaceTables& before, const std::optional<Ipv4Prefixed>& wanted, bool endLeases) {
    const std::optional<std::size_t> place = reportedAddress(before);
    const AddressObject* old = place ? &before.addresses[*place] : nullptr;
    if (!wanted) {
        return exchangeFor(before, nullptr, old, endLeases);
    }
    const AddressObject fresh = makeAddress(before, *wanted, old);
    const bool onlyStays = old != nullptr && old->isSame(fresh);
    const bool othersStay = !endLeases || std::all_of(before.addresses.begin(), before.addresses.end(),
                                                      [&](const AddressObject& address) {
                                                          return &address == old || address.isPermanent();
                                                      });
    return onlyStays && othersStay ? keep(before, *place) : exchangeFor(before, &fresh, old, endLeases);
}

AddressPlan planLeaseFirst(const InterfaceTables& before) {
    const auto lease = std::find_if(before.addresses.begin(), before.addresses.end(),
                                    [](const AddressObject& address) { return !address.isPermanent(); });
    if (lease == before.addresses.end() || &*lease == &before.addresses[*reportedAddress(before)]) {
        return {{}, before.addresses, true};
    }
    return exchangeFor(before, &*lease, nullptr, false);
}

} // namespace Orv::Agent::Linux
