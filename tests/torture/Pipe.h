/**
 * @file
 * Whole blocks through pipes.
 */
#pragma once

#include <cstddef>

namespace Torture {

/** @return false at the end, or after a failure */
bool readAll(int descriptor, void* bytes, std::size_t size);
bool writeAll(int descriptor, const void* bytes, std::size_t size);

}  // namespace Torture
