#pragma once

#include <memory>
#include <utility>
#include <vector>

#include "EventPrinter.h"

namespace Cli {

/** Hands every event to several printers, in the order in which they were added. */
class PrinterList : public EventPrinter {
  public:
    void add(std::unique_ptr<EventPrinter> printer) { printers.push_back(std::move(printer)); }

    void print(const SessionEvent& event) override {
        for (const std::unique_ptr<EventPrinter>& printer : printers) {
            printer->print(event);
        }
    }

  private:
    std::vector<std::unique_ptr<EventPrinter>> printers;
};

}  // namespace Cli
