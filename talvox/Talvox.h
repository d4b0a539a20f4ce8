/**
 * @file
 * The engine's entry object.
 */
#pragma once

#include <atomic>
#include <boost/shared_ptr.hpp>
#include <string>
#include <vector>

#include "core/util/Singleton.h"
#include "pal/kd_thread.h"
#include "talvox/Export.h"
#include "talvox/Recognizer.h"
#include "talvox/RecognizerListener.h"
#include "talvox/Settings.h"

namespace Network {
class NetworkTaskHolder;
}

namespace Talvox {

class ReserveRecognizer;

/**
 * Holds the engine-wide settings, decides which mechanism serves a recognition, makes recognizers
 * and admits one active recognition at a time. One per process, made on first use.
 *
 * Threads: any, for every operation; none waits for the network or a device.
 */
class TALVOX_API Talvox : public Util::Singleton<Talvox> {
  public:
    /** What serves a recognition; the numbers are fixed. */
    enum RecognitionMechanism : int {
        MechanismKorvel = 0,   /**< the cloud service */
        MechanismPlatform = 1, /**< the platform's own recognizer */
        MechanismDummy = 2     /**< none is available */
    };

    /** Recognizers point to the facade, and an application may have them in static objects. */
    static constexpr bool STAYS_AT_PROCESS_END = true;

    /** The engine's version, "133". */
    static const std::string VERSION;

    /** The one of the process, made on first use. */
    static Talvox& getInstance();

    Talvox(const Talvox&) = delete;
    Talvox& operator=(const Talvox&) = delete;
    ~Talvox() override;

    /**
     * The engine-wide settings as they are now; never null, never changed in place. Takes no lock.
     */
    boost::shared_ptr<const Settings> getTalvoxSettings() const;

    /**
     * Installs new engine-wide settings, for recognitions that start from now on. They are neither
     * checked nor repaired (see `Settings`). The caller must not change the object any more; to
     * change settings, clone what `getTalvoxSettings` returns, change the clone and install that.
     * @param settings not null (else nothing is installed)
     */
    void setTalvoxSettings(const boost::shared_ptr<Settings>& settings);

    /**
     * Makes `recognizer` the active one. Called by a recognizer when it starts.
     * @return false when another (or the same) recognizer is active
     */
    bool registerRecognizer(Recognizer* recognizer) const;

    /**
     * Clears the active recognizer if it is `recognizer`. Called by a recognizer immediately before
     * its terminal event and in its destructor. Takes no lock.
     */
    void unregisterRecognizer(Recognizer* recognizer) const;

    /** Decides by the settings and by what the platform offers; writes one line to the log. */
    RecognitionMechanism getRecognitionMechanism(const Settings& settings) const;

    /** The decision alone. @param platformSupported the platform offers recognition */
    static RecognitionMechanism decideMechanism(const Settings& settings, bool platformSupported);

    /** True when anything but the stand-in would serve a recognition with these settings. */
    bool isRecognitionAvailable(const Settings& settings) const;

    /** The same for a decision already made. */
    static bool isAvailable(RecognitionMechanism mechanism);

    /**
     * Makes a recognizer; nothing is started. It works on a validated copy of the settings. A value
     * that has no effect there (see `Settings::keyLevels`) and differs from the engine's is logged
     * once: "KEY has no effect on a recognizer, set it on the engine". A recognizer whose settings
     * begin as a clone of the engine's logs only what the application changed.
     * @param listener held weakly
     * @param settings not null; never changed
     * @return the recognizer, owned by the caller. Where memory is short, a stand-in with the
     * default settings, whose `start` reports `ErrorUnknown`; it takes no memory. There is one:
     * null while an earlier caller still owns it
     */
    boost::shared_ptr<Recognizer> createRecognizer(
        const boost::shared_ptr<RecognizerListener>& listener,
        const boost::shared_ptr<const Settings>& settings) const;

    /**
     * The languages of all mechanisms, each once, in ascending byte order. Computed once, but as
     * long as a platform does not know its own, asked of it again: until then a later call may
     * change the list, which is therefore to be read under the event lock. Takes the event lock.
     */
    const std::vector<std::string>& getAvailableLanguages() const;

    /** Joins two lists of languages into one that is sorted and free of duplicates. */
    static std::vector<std::string> mergeLanguages(const std::vector<std::string>& first,
                                                   const std::vector<std::string>& second);

  private:
    friend class Util::Singleton<Talvox>;
    Talvox();

    static bool isPlatformSupported();
    static void logMechanism(RecognitionMechanism mechanism, const Settings& settings,
                             bool platformSupported);
    boost::shared_ptr<Recognizer> makeRecognizer(
        const boost::shared_ptr<RecognizerListener>& listener,
        const boost::shared_ptr<const Settings>& settings) const;
    boost::shared_ptr<Recognizer> makeRecognizer(
        RecognitionMechanism mechanism, const boost::shared_ptr<const Settings>& settings) const;
    boost::shared_ptr<Recognizer> lendReserve(
        const boost::shared_ptr<RecognizerListener>& listener) const noexcept;

    boost::shared_ptr<const Settings> talvoxSettings;

  public:
    /**
     * Keeps fire-and-forget requests alive: whoever submits one appends its holder, and removes it
     * when the request has finished. Used under the event lock only.
     */
    std::vector<boost::shared_ptr<Network::NetworkTaskHolder>> runningTaskHolders;

  private:
    const boost::shared_ptr<ReserveRecognizer> reserve;
    KDThreadMutex* registrationLock;
    mutable std::atomic<Recognizer*> activeRecognizer;
};

}  // namespace Talvox
