// An event logger that writes records as a named source and installs nothing: the library's
// default logger stays the installed one (a second installed logger is refused).
#pragma once

#include "Cli.h"
#include "owutils/Application.h"
#include "owutils/EventLogger.h"
#include "owutils/LmResources.h"

namespace owutil {

class SourceLogger : public LumoException::EventLogger {
 public:
  // Registers `source` with `messageFile` (the module whose message table formats its records)
  // and sends messages, and exceptions with id `exceptionEventId`, to the event log.
  SourceLogger(const Lumo::String& source, const Lumo::String& messageFile, DWORD exceptionEventId = 0)
      : EventLogger(source.c_str(), nullptr) {
    m_nMessageTargets = LumoException::ToEventLog;
    m_nExceptionTargets = LumoException::ToEventLog;
    m_nExceptionEventId = static_cast<std::int32_t>(exceptionEventId);
    m_strMessageFile = messageFile;
    m_hEventSource = RegisterSource(source, messageFile);
  }
};

// The engine resource module of the user's language, whose message table formats the records
// of the ids it holds.
inline Lumo::String EngineMessageFile() {
  HINSTANCE module = nullptr;
  CString name;
  if (!LoadResourceModule(CString(u"EngineRes"), &module, name))
    throw Failure("no message file: the engine resource module could not be loaded");
  return Lumo::String(Application::GetModulePath(module).str());
}

}  // namespace owutil
