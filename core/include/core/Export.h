/**
 * @file
 * Export macro of libKorvelCore.
 */
#pragma once

/** Marks what the library exports. */
#define KORVEL_CORE_API __attribute__((visibility("default")))
