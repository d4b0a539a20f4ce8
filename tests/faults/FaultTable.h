/**
 * @file
 * The table of docs/FAULTS.md.
 */
#pragma once

#include "Catalogue.h"

namespace FaultTest {

/** Fails unless the document says of this fault what was observed; or notes it, to be written. */
void checkTable(const Fault& fault, bool chunked, const SessionOutcome& outcome);

/** Fails unless the document's rows are those of the catalogue, in its order. */
void checkRows();

}  // namespace FaultTest
