// Where reports go: the installed event logger, and the logger registered as "LM_EVENT_HANDLER".
//
// The library's exports that report instead of throwing use these, never the logger directly:
//
//   catch (LumoException::Exception& e) {
//     LumoException::detail::ReportToEventHandler(e, u"LoadResourceModule");
//     return false;
//   }
//   LumoException::detail::ReportWarningToEventHandler(text.c_str());   // a finished text
//
// None of them raises: a report that cannot be delivered is dropped.
#pragma once

#include "owutils/Exception.h"
#include "owutils/WinTypes.h"

namespace LumoException::detail {

// Hands `e` to the process-wide installed event logger. Returns false when none is installed.
bool ReportToInstalledLogger(const Exception& e, const char16_t* text);

// Hands `e` with `text` to the ReportException of the event logger registered under
// "LM_EVENT_HANDLER". Skips the report when a caller has deleted that entry.
void ReportToEventHandler(const Exception& e, const char16_t* text) noexcept;

// Hands a finished text to the logger registered under "LM_EVENT_HANDLER" as a warning (event
// type 2). The text is the single insert of the template "%1", so it reaches the log unchanged.
// Skips the report when a caller has deleted that entry.
void ReportWarningToEventHandler(const char16_t* text) noexcept;
// The same with an event id of the caller's (the one above uses the logger's default id).
void ReportWarningToEventHandler(DWORD eventId, const char16_t* text) noexcept;

}  // namespace LumoException::detail
