// Crash reporting: loading the outside component and installing it with the report address and
// language file built from the engine's OEM data and the user-interface language.
#include "owutils/LmCrashReporting.h"

#include <cstring>
#include <mutex>
#include <string>

#include "ErrorHandler/Reporting.h"
#include "owutils/Application.h"
#include "owutils/EventLogger.h"
#include "owutils/Exceptions.h"
#include "owutils/LmOem.h"
#include "owutils/LmResources.h"
#include "owutils/NamedObjects.h"
#include "owutils/Paths.h"
#include "owutils/StringEncodeDecode.h"
#include "platform/Errors.h"
#include "platform/Modules.h"

namespace {

// ---- What this unit takes from the rest of the library ------------------------------------

constexpr WORD kWarning = 2;

// A finished text as a warning with `eventId` to the logger registered as "LM_EVENT_HANDLER";
// the text is the single insert of the template, so it reaches the log unchanged.
void ReportWarning(long eventId, const Lumo::String& text) {
  try {
    if (auto* logger = static_cast<LumoException::EventLogger*>(LmObjectGet(u"LM_EVENT_HANDLER"))) {
      logger->ReportMessage(kWarning, static_cast<DWORD>(eventId), u"%1", text.c_str());
    }
  } catch (...) {
    // A report that cannot be delivered is dropped; the caller still returns its failure.
  }
}

// A file beside this library, in long-path form.
CString PathBesideLibrary(const char16_t* name) {
  return Paths::Combine(Application::GetModuleLongDirectory(nullptr), CString(name));
}

// The engine's OEM record, when the engine module is loaded or can be loaded.
const _tagSYSOEM* EngineOemRecord() {
  _tagSYSOEM* oem = nullptr;
  return GetOEMDataTextPtr(&oem) == 0 ? oem : nullptr;
}

// ---- The component -------------------------------------------------------------------------

constexpr char16_t kComponentBaseName[] = u"CrashRpt1403";
constexpr UINT kErrorTextSize = 256;
constexpr char16_t kFailurePrefix[] = u"crInstall failure: ";

// The component's calls once it is loaded; all five are present or the component is not used.
struct Component {
  HMODULE module = nullptr;
  crInstallW_t install = nullptr;
  crUninstall_t uninstall = nullptr;
  crAddFile2W_t addFile = nullptr;
  crAddPropertyW_t addProperty = nullptr;
  crGetLastErrorMsgW_t lastErrorMessage = nullptr;
};

std::mutex g_componentLock;
Component g_component;  // guarded by g_componentLock

Lumo::String ComponentFileName() { return Lumo::String(kComponentBaseName) + Platform::ModuleFileSuffix(); }

// Loads the module beside this library, else through the system loader's search. Null with the
// last error of the attempt that says most: a module found beside the library but unusable
// outranks "not found" from the search.
HMODULE LoadComponentModule(const Lumo::String& fileName) {
  DWORD besideError = ERROR_MOD_NOT_FOUND;
  try {
    const CString beside = PathBesideLibrary(fileName.c_str());
    if (HMODULE module = Platform::LoadLibraryW(beside.GetString())) return module;
    besideError = Platform::GetLastError();
  } catch (LumoException::Exception&) {
    // No directory for this library: only the search is left.
  }
  if (HMODULE module = Platform::LoadLibraryW(fileName.c_str())) return module;
  if (besideError != ERROR_MOD_NOT_FOUND) Platform::SetLastError(besideError);
  return nullptr;
}

template <typename Function>
bool Resolve(HMODULE module, const char* name, Function& function) {
  function = reinterpret_cast<Function>(Platform::GetProcAddress(module, name));
  return function != nullptr;
}

// The loaded component; loads it on the first call. On failure returns false with `failure`
// set to the text that follows the failure prefix.
bool LoadComponent(Component& component, Lumo::String& failure) {
  std::lock_guard<std::mutex> lock(g_componentLock);
  if (g_component.module != nullptr) {
    component = g_component;
    return true;
  }
  const Lumo::String fileName = ComponentFileName();
  Component loaded;
  loaded.module = LoadComponentModule(fileName);
  if (loaded.module != nullptr) {
    // A component without one of the calls is refused whole, instead of failing later inside a
    // client's call.
    if (Resolve(loaded.module, "crInstallW", loaded.install) && Resolve(loaded.module, "crUninstall", loaded.uninstall) &&
        Resolve(loaded.module, "crAddFile2W", loaded.addFile) &&
        Resolve(loaded.module, "crAddPropertyW", loaded.addProperty) &&
        Resolve(loaded.module, "crGetLastErrorMsgW", loaded.lastErrorMessage)) {
      g_component = loaded;
      component = loaded;
      return true;
    }
    const DWORD error = Platform::GetLastError();
    Platform::FreeLibrary(loaded.module);
    Platform::SetLastError(error);
  }
  const DWORD error = Platform::GetLastError();
  failure.Format(u"unable to load module '%s', %s", fileName.c_str(),
                 LumoException::SystemErrorText(static_cast<int>(error), true).c_str());
  return false;
}

// The component if an earlier LmCrashReportingInit loaded it.
bool LoadedComponent(Component& component) {
  std::lock_guard<std::mutex> lock(g_componentLock);
  component = g_component;
  return component.module != nullptr;
}

void ReportInstallFailure(long eventId, const Lumo::String& detail) {
  ReportWarning(eventId, Lumo::String(kFailurePrefix) + detail);
}

// Version numbers and OEM name for the report address, from the engine's OEM record when the
// engine module is loaded or can be loaded.
struct VersionInfo {
  int major = 19;
  int minor = 0;
  int build = 0;
  Lumo::String oemName;
};

VersionInfo ReadVersionInfo() {
  VersionInfo info;
  const _tagSYSOEM* oem = EngineOemRecord();
  if (oem == nullptr) return info;
  info.major = static_cast<int>(oem->dwMajorVersion);
  info.minor = static_cast<int>(oem->dwMinorVersion);
  info.build = static_cast<int>(oem->dwBuild);
  // The field need not be terminated within its bounds.
  const std::string narrow(oem->szReportName, strnlen(oem->szReportName, sizeof oem->szReportName));
  info.oemName.AssignAnsi(narrow.c_str());
  return info;
}

}  // namespace

bool LmCrashReportingInit(const CString& appName, const CString& url, LmCrashCallback callback, long eventId,
                          bool interactive) {
  try {
    const VersionInfo version = ReadVersionInfo();

    Lumo::String versionText;
    versionText.Format(u"%d.%d.%d.0", version.major, version.minor, version.build);

    const Lumo::String encodedName = Lumo::EncodeURI(version.oemName.c_str());
    Lumo::String reportUrl;
    reportUrl.Format(u"%s?cn=%s&maj=%d&min=%d&bld=%d", url.GetString(), encodedName.c_str(), version.major,
                     version.minor, version.build);

    Lumo::String languageFile;
    languageFile.Format(u"crashrpt_lang_%s.ini", GetLanguageIdString());
    const CString languagePath = PathBesideLibrary(languageFile.c_str());

    Component component;
    Lumo::String failure;
    if (!LoadComponent(component, failure)) {
      ReportInstallFailure(eventId, failure);
      return false;
    }

    LmCrashInstallInfo info;
    std::memset(&info, 0, sizeof info);
    info.cb = static_cast<std::uint16_t>(sizeof info);
    info.pszAppName = appName.GetString();
    info.pszAppVersion = versionText.c_str();
    info.pszUrl = reportUrl.c_str();
    info.pfnCrashCallback = callback;
    info.uPriorities[kLmCrashPriorityHttp] = 0;
    info.uPriorities[kLmCrashPrioritySmtp] = kLmCrashPriorityNotUsed;
    info.uPriorities[kLmCrashPrioritySimpleMapi] = kLmCrashPriorityNotUsed;
    info.dwFlags = interactive ? kLmCrashFlagsInteractive : kLmCrashFlagsSilent;
    info.pszLangFilePath = languagePath.GetString();

    if (component.install(&info) == 0) return true;

    char16_t text[kErrorTextSize] = {};
    component.lastErrorMessage(text, kErrorTextSize);
    text[kErrorTextSize - 1] = 0;  // whatever the component wrote, it ends here
    ReportInstallFailure(eventId, Lumo::String(text));
    return false;
  } catch (LumoException::Exception& e) {
    LumoException::detail::ReportToEventHandler(e, u"LmCrashReportingInit");
    return false;
  }
}

void LmCrashReportingAddFile(const CString& file, const CString& description) {
  Component component;
  if (!LoadedComponent(component)) return;
  component.addFile(file.GetString(), nullptr, description.GetString(), 0);
}

bool LmCrashReportingAddProperty(const CString& name, const CString& value) {
  try {
    Component component;
    if (!LoadedComponent(component)) {
      THROW_AT(LumoException::Win32ErrorCode(Lumo::String(u"crAddPropertyW"), ERROR_MOD_NOT_FOUND));
    }
    const int status = component.addProperty(name.GetString(), value.GetString());
    ASSERTION1(status == 0, status);
    return true;
  } catch (LumoException::Exception& e) {
    LumoException::detail::ReportToEventHandler(e, u"LmCrashReportingAddProperty");
    return false;
  }
}

void LmCrashReportingDeinit() {
  Component component;
  if (!LoadedComponent(component)) return;
  component.uninstall();
}
