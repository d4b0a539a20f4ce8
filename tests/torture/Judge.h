/**
 * @file
 * Whether a point ended as it must.
 */
#pragma once

#include <string>
#include <vector>

#include "Order.h"
#include "Plan.h"
#include "Surroundings.h"
#include "Worker.h"

namespace Torture {

/** What a run of a session in which nothing fails leaves and sends. */
struct Reference {
    Report report;
    Traffic traffic;
};

/** How a session ended. The order is that of the document. */
enum class Ending : int {
    UNHURT,    /**< as without the failure */
    ERROR,     /**< one error */
    REFUSED,   /**< no recognizer, by a null pointer */
    UNREACHED, /**< there was no such call */
};

constexpr int ENDING_COUNT = 4;

struct Judgement {
    Ending ending = Ending::UNHURT;
    std::vector<std::string> faults; /**< empty when all is as it must be */
};

Judgement judge(const Plan& plan, const Reference& reference, const Order& order,
                const Answer& answer, const Traffic& traffic);

/** What is wrong with a run in which nothing was to fail; empty when it can be a reference. */
std::vector<std::string> judgeReference(const Plan& plan, const Answer& answer,
                                        const Traffic& traffic);

}  // namespace Torture
