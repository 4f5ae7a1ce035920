// CMPI return codes by name and number, for --upcall-failure and for the output.
#pragma once

#include <cmpidt.h>

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace bluelight::cli {

/// Every return code the CMPI headers define, in numeric order.
const std::vector<CMPIrc>& knownReturnCodes();

/// The code that `text` names: its full name ("CMPI_RC_ERR_ACCESS_DENIED"), the name without the
/// "CMPI_RC_" prefix ("ERR_ACCESS_DENIED"), either ignoring case, or its number ("2"). nullopt for
/// anything else, including numbers the headers do not define.
std::optional<CMPIrc> parseReturnCode(std::string_view text);

/// "CMPI_RC_OK", "CMPI_RC_ERR_FAILED", ...
std::string returnCodeName(CMPIrc code);

}  // namespace bluelight::cli
