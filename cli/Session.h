#pragma once

#include <boost/shared_ptr.hpp>

#include "EventPrinter.h"
#include "EventQueue.h"
#include "talvox/Recognizer.h"
#include "talvox/Settings.h"

namespace Cli {

class SessionListener;

/**
 * One recognition with the engine, with the recorder that `Sound::Recorder`'s factory makes.
 * `run` belongs to one thread; `interrupt` may be called by any.
 */
class Session {
  public:
    /** @param recognitionSettings become the engine's settings, too; not changed any more */
    explicit Session(boost::shared_ptr<Talvox::Settings> recognitionSettings);
    ~Session();

    /**
     * Starts, hands every event to `printer` on the calling thread and returns the last one. The
     * engine's time limits bound the wait.
     */
    SessionEvent run(EventPrinter& printer);

    /** Cancels the recognition; `run` then ends with `ErrorCanceled` unless it was over. */
    void interrupt() { queue->interrupt(); }

  private:
    boost::shared_ptr<Talvox::Settings> settings;
    boost::shared_ptr<EventQueue> queue;
    boost::shared_ptr<SessionListener> listener;
    boost::shared_ptr<Talvox::Recognizer> recognizer;
};

}  // namespace Cli
