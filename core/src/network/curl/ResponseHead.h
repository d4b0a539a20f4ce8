#pragma once

#include <boost/shared_ptr.hpp>
#include <cstddef>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "core/network/HttpResponse.h"

namespace Network {

/** Gathers the header lines of a response. */
class ResponseHead {
  public:
    /** Whether a line of so many bytes still finds room; interim heads and trailers count too. */
    bool hasRoom(std::size_t size) const;

    /** Takes the next line, with its end. @return true when it was the empty line */
    bool addLine(std::string_view line);

    bool has(const std::string& name) const;

    boost::shared_ptr<HttpResponse> makeResponse(int status) const;

  private:
    std::vector<std::pair<std::string, std::string>> fields;
    std::size_t bytes = 0;
};

}  // namespace Network
