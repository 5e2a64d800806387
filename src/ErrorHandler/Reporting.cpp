#include "ErrorHandler/Reporting.h"

namespace LumoException::detail {

// The event logger and the named-object registry plug in here; until one is installed there is
// nobody to hand an exception to, and the callers take their fallback path.
bool ReportToInstalledLogger(const Exception&, const char16_t*) { return false; }

void ReportToEventHandler(const Exception&, const char16_t*) {}

}  // namespace LumoException::detail
