#include "ReturnCodes.h"

#include <cmpihost/status.h>

#include <charconv>

#include "text/Text.h"

namespace bluelight::cli {

const std::vector<CMPIrc>& knownReturnCodes() {
  static const std::vector<CMPIrc> codes = {
      CMPI_RC_OK,
      CMPI_RC_ERR_FAILED,
      CMPI_RC_ERR_ACCESS_DENIED,
      CMPI_RC_ERR_INVALID_NAMESPACE,
      CMPI_RC_ERR_INVALID_PARAMETER,
      CMPI_RC_ERR_INVALID_CLASS,
      CMPI_RC_ERR_NOT_FOUND,
      CMPI_RC_ERR_NOT_SUPPORTED,
      CMPI_RC_ERR_CLASS_HAS_CHILDREN,
      CMPI_RC_ERR_CLASS_HAS_INSTANCES,
      CMPI_RC_ERR_INVALID_SUPERCLASS,
      CMPI_RC_ERR_ALREADY_EXISTS,
      CMPI_RC_ERR_NO_SUCH_PROPERTY,
      CMPI_RC_ERR_TYPE_MISMATCH,
      CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED,
      CMPI_RC_ERR_INVALID_QUERY,
      CMPI_RC_ERR_METHOD_NOT_AVAILABLE,
      CMPI_RC_ERR_METHOD_NOT_FOUND,
      CMPI_RC_DO_NOT_UNLOAD,
      CMPI_RC_NEVER_UNLOAD,
      CMPI_RC_ERR_INVALID_HANDLE,
      CMPI_RC_ERR_INVALID_DATA_TYPE,
      CMPI_RC_ERROR_SYSTEM,
      CMPI_RC_ERROR,
  };
  return codes;
}

std::string returnCodeName(CMPIrc code) { return cmpihost::rcName(code); }

std::optional<CMPIrc> parseReturnCode(std::string_view text) {
  if (text.empty()) return std::nullopt;
  // A number must be one the headers define: any other value is not a CMPIrc at all.
  int number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  const bool isNumber = error == std::errc() && end == text.data() + text.size();
  constexpr std::string_view prefix = "CMPI_RC_";
  for (const CMPIrc code : knownReturnCodes()) {
    if (isNumber) {
      if (static_cast<int>(code) == number) return code;
      continue;
    }
    const std::string name = returnCodeName(code);
    if (Kesta::platform::equalsIgnoringCase(text, name) ||
        Kesta::platform::equalsIgnoringCase(text, std::string_view(name).substr(prefix.size()))) {
      return code;
    }
  }
  return std::nullopt;
}

}  // namespace bluelight::cli
