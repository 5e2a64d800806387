// Where the exception core hands exceptions for logging.
#pragma once

#include "owutils/Exception.h"

namespace LumoException::detail {

// Hands `e` to the process-wide installed event logger. Returns false when none is installed.
bool ReportToInstalledLogger(const Exception& e, const char16_t* text);

// Hands `e` to the event logger registered under "LM_EVENT_HANDLER". Skips the report when a
// caller has deleted that entry.
void ReportToEventHandler(const Exception& e, const char16_t* text);

}  // namespace LumoException::detail
