#pragma once

namespace Gateway {

/** The parts of the page; the build embeds them from the files in gateway/page. */
extern const char PAGE_HTML[];
extern const char PAGE_CSS[];
extern const char PAGE_JS[];

}  // namespace Gateway
