#include "Session.h"

#include <boost/make_shared.hpp>
#include <optional>
#include <utility>

#include "SessionListener.h"
#include "talvox/Talvox.h"

namespace Cli {

Session::Session(boost::shared_ptr<Talvox::Settings> recognitionSettings)
    : settings(std::move(recognitionSettings)), queue(boost::make_shared<EventQueue>()) {}

Session::~Session() = default;

SessionEvent Session::run(EventPrinter& printer) {
    Talvox::Talvox& engine = Talvox::Talvox::getInstance();
    engine.setTalvoxSettings(settings);
    listener = boost::make_shared<SessionListener>(queue);
    recognizer = engine.createRecognizer(listener, settings);
    recognizer->start();
    for (;;) {
        const std::optional<SessionEvent> event = queue->take();
        if (!event) {
            recognizer->cancel();
            continue;
        }
        printer.print(*event);
        if (event->isTerminal()) {
            return *event;
        }
    }
}

}  // namespace Cli
