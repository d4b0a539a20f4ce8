/**
 * @file
 * Where the recognizer of the platform joins the engine.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>
#include <vector>

#include "talvox/Export.h"
#include "talvox/Recognizer.h"
#include "talvox/Settings.h"

namespace Talvox {

class Talvox;

/**
 * What the platform's own recognizer offers. The layer that knows the platform installs one; the
 * facade asks it under the event lock.
 *
 * Must not: block, throw.
 */
class TALVOX_API PlatformMechanism {
  public:
    virtual ~PlatformMechanism();

    /** Whether the platform recognises speech; asked once per decision. */
    virtual bool isRecognitionAvailable() = 0;

    /** Tags of the platform's languages; may be empty as long as it does not know. */
    virtual std::vector<std::string> getAvailableLanguages() = 0;

    /** A new recognizer that is not started yet; without one the stand-in serves. */
    virtual boost::shared_ptr<Recognizer> createRecognizer(
        const Talvox* facade, const boost::shared_ptr<const Settings>& settings) = 0;

    /**
     * Makes `mechanism` the one that the facade asks from now on. Takes the event lock.
     * @param mechanism not owned, must stay alive while it is installed; null for none
     */
    static void install(PlatformMechanism* mechanism);

    /** What was installed last, or null. To be used under the event lock. */
    static PlatformMechanism* getInstalled();

  protected:
    PlatformMechanism() = default;
    PlatformMechanism(const PlatformMechanism&) = default;
    PlatformMechanism& operator=(const PlatformMechanism&) = default;
};

}  // namespace Talvox
