/**
 * @file
 * Null checks of shared pointers.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "pal/kd_assert.h"

namespace Talvox {

/**
 * Reports a null pointer as its dereference would be reported, but lets the caller go on without
 * it where the assertion handler returns.
 */
template <typename T>
bool isPresent(const boost::shared_ptr<T>& pointer) {
    return KOR_ASSERT_AT(pointer, "px != 0", "talvox/impl/IsPresent", __LINE__);
}

}  // namespace Talvox
