#include "core/sound/Encoder.h"

namespace Sound {

Encoder::~Encoder() = default;

bool Encoder::hasFailed() const {
    return false;
}

}  // namespace Sound
