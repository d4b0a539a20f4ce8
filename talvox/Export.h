/**
 * @file
 * Export macro of libKorvelTalvox.
 */
#pragma once

#define TALVOX_API __attribute__((visibility("default")))
