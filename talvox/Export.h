/**
 * @file
 * Export macro of libKorvelTalvox.
 */
#pragma once

/** Marks what the library exports. */
#define TALVOX_API __attribute__((visibility("default")))
