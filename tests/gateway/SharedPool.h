/**
 * @file
 * The decoders of the tests of one process: loading a model takes a quarter of a second.
 */
#pragma once

#include "gateway/DecoderPool.h"

namespace GatewayTest {

inline Gateway::DecoderPool& sharedPool() {
    static Gateway::DecoderPool pool(Gateway::SpeechModel(), 2);
    return pool;
}

}  // namespace GatewayTest
