/**
 * @file
 * Head of an HTTP response.
 */
#pragma once

#include <map>
#include <optional>
#include <string>

#include "core/Export.h"

namespace Network {

/** Status and headers of one response. Immutable once handed out; any thread. */
class KORVEL_CORE_API HttpResponse {
  public:
    /** A response without headers. */
    explicit HttpResponse(int statusCode);

    /** The HTTP status. */
    int getStatus() const;

    /**
     * The value of the first header of that name, without white space around it. Names are
     * compared without regard to case.
     */
    std::optional<std::string> getHeader(const std::string& name) const;

    /** Stores a header unless one of that name is there already. */
    void addHeader(const std::string& name, const std::string& value);

  private:
    int status;
    std::map<std::string, std::string> headers;
};

}  // namespace Network
