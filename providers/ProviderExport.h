/**
 * @file
 * How a provider is offered to object managers.
 */
#pragma once

/** The factories, and nothing else, are visible outside of the library, under unmangled names. */
#define MARLO_PROVIDER_FACTORY extern "C" __attribute__((visibility("default")))

namespace Orv::NetworkAdapterComposite {

/** CMPI 2.0, as function tables state it. */
inline constexpr int MI_VERSION = 200;

} // namespace Orv::NetworkAdapterComposite
