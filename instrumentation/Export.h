/**
 * @file
 * Visibility of the agent library's operations.
 *
 * Everything is built with hidden visibility; what the agent library offers carries ORV_API.
 */
#pragma once

#define ORV_API __attribute__((visibility("default")))
