/**
 * @file
 * Stand-in where no recognition is available.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "talvox/Export.h"
#include "talvox/Recognizer.h"

namespace Talvox {

/** Answers at once: `start` and `stop` with `ErrorNotAvailable`, `cancel` with `ErrorCanceled`. */
class TALVOX_API DummyRecognizer : public Recognizer {
  public:
    /** As `Recognizer`'s. */
    DummyRecognizer(const Talvox* facade, const boost::shared_ptr<const Settings>& settings);
    ~DummyRecognizer() override;

    void start() override;
    void stop() override;
    void cancel() override;
};

}  // namespace Talvox
