#include "ErrorHandler/Reporting.h"

#include "owutils/EventLogger.h"
#include "owutils/NamedObjects.h"

namespace LumoException::detail {
namespace {

constexpr WORD kWarning = 2;

EventLogger* EventHandler() { return static_cast<EventLogger*>(LmObjectGet(u"LM_EVENT_HANDLER")); }

}  // namespace

bool ReportToInstalledLogger(const Exception& e, const char16_t* text) {
  EventLogger* logger = EventLogger::GetInstalledLogger();
  if (logger == nullptr) return false;
  logger->ReportException(e, text);
  return true;
}

void ReportToEventHandler(const Exception& e, const char16_t* text) noexcept {
  try {
    if (EventLogger* logger = EventHandler()) logger->ReportException(e, text);
  } catch (...) {
    // A logger's hook that raises does not turn a report into a failure of its caller.
  }
}

void ReportWarningToEventHandler(const char16_t* text) noexcept {
  try {
    if (EventLogger* logger = EventHandler()) logger->ReportMessage(kWarning, u"%1", text == nullptr ? u"" : text);
  } catch (...) {
  }
}

void ReportWarningToEventHandler(DWORD eventId, const char16_t* text) noexcept {
  try {
    if (EventLogger* logger = EventHandler()) logger->ReportMessage(kWarning, eventId, u"%1", text == nullptr ? u"" : text);
  } catch (...) {
  }
}

}  // namespace LumoException::detail
