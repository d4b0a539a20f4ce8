#include "core/tasking/Task.h"

namespace Tasking {

Task::Task() = default;

Task::~Task() = default;

}  // namespace Tasking
