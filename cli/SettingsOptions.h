#pragma once

#include <boost/shared_ptr.hpp>
#include <string>
#include <utility>
#include <vector>

#include "talvox/Settings.h"

namespace Cli {

/** Where the settings of a run come from, in the order in which the sources are applied. */
struct SettingsOptions {
    using Assignment = std::pair<std::string, std::string>; /**< key, text of the value */

    std::vector<Assignment> defaults;       /**< the tool's own, over the engine's */
    std::string file;                       /**< configuration document; empty for none */
    bool repairDocument = false;            /**< validate what the defaults and `file` make */
    std::vector<std::string> assignments;   /**< key=value */
    std::vector<Assignment> explicitValues; /**< options that name one setting each */
};

/**
 * Stores a value given as text under the type that the key has: a boolean as one of yes, no, true,
 * false, on, off, 1 and 0 in any case, other types in the value syntax of a configuration document.
 * Any spelling of the key is accepted that normalises to it.
 * @throws UsageError when there is no such setting, or the text is not wholly a value of its type
 */
void assign(Talvox::Settings& settings, const std::string& key, const std::string& text);

/**
 * The settings that all sources together make. Names and values in the document at `file` are
 * treated as the engine treats them: what is wrong is logged and skipped or repaired. A document
 * that is not XML, breaks off or lacks the element with the settings is not used in part, as the
 * engine would. With `repairDocument`, values in it that validation does not accept are repaired
 * and logged as well; what the user assigns by hand stays as it is.
 * @throws UsageError when the file cannot be read or used, or an assignment is wrong
 */
boost::shared_ptr<Talvox::Settings> buildSettings(const SettingsOptions& options);

}  // namespace Cli
