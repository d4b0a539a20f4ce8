/**
 * @file
 * The locale of a host application that writes numbers with a comma.
 */
#pragma once

#include <clocale>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "support/ChildProcess.h"
#include "support/ScratchDirectory.h"

namespace TestSupport {

/**
 * Gives the C library German numbers while it lives. Made from the system's sources of locales, so
 * that none needs to be installed ready for use.
 */
class CommaLocale {
  public:
    CommaLocale() : oldNumbers(std::setlocale(LC_NUMERIC, nullptr)) {
        if (const char* path = std::getenv("LOCPATH")) {
            oldPath = path;
        }
        if (!isAvailable()) {
            return;
        }
        const ChildProcess::Result made = ChildProcess::run(
            {"localedef", "-i", "de_DE", "-f", "ISO-8859-1", directory.path("de_DE")});
        setenv("LOCPATH", directory.path().c_str(), 1);
        set = made.exitStatus == 0 && std::setlocale(LC_NUMERIC, "de_DE") != nullptr &&
              std::string(std::localeconv()->decimal_point) == ",";
    }
    ~CommaLocale() {
        std::setlocale(LC_NUMERIC, oldNumbers.c_str());
        if (oldPath.empty()) {
            unsetenv("LOCPATH");
        } else {
            setenv("LOCPATH", oldPath.c_str(), 1);
        }
    }
    CommaLocale(const CommaLocale&) = delete;
    CommaLocale& operator=(const CommaLocale&) = delete;

    /** True when this machine can make the locale. */
    static bool isAvailable() {
        return ChildProcess::isInstalled("localedef") &&
               std::filesystem::exists("/usr/share/i18n/locales/de_DE");
    }

    /** True when numbers have a comma now. */
    bool isSet() const { return set; }

  private:
    const ScratchDirectory directory;
    const std::string oldNumbers;
    std::string oldPath;
    bool set = false;
};

}  // namespace TestSupport
