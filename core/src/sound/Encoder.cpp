#include "core/sound/Encoder.h"

namespace Sound {

Encoder::~Encoder() = default;

}  // namespace Sound
