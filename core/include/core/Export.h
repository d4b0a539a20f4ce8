/**
 * @file
 * Export macro of libKorvelCore.
 */
#pragma once

#define KORVEL_CORE_API __attribute__((visibility("default")))
