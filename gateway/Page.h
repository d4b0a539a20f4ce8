#pragma once

#include <string>

#include "gateway/Answer.h"
#include "gateway/SessionList.h"

namespace Gateway {

/** What the page needs of a request. */
struct PageRequest {
    std::string path;
    /** The Host header. */
    std::string host;
    /** Arguments of the query. */
    std::string instance;
    std::string after;
    std::string id;
};

/**
 * The page of the last sessions, for a browser on the same machine. It consists of static parts,
 * whose script asks for changes twice a second and writes what clients sent as text, never as
 * markup. A Content-Security-Policy allows nothing but these parts.
 */
namespace Page {

/** Whether a path belongs to the page. */
bool owns(const std::string& path);

/**
 * Answers a GET or HEAD request for a path of the page. A request that does not name the loopback
 * interface as its host gets status 403.
 */
Answer answer(const SessionList& sessions, const PageRequest& request);

}  // namespace Page

}  // namespace Gateway
