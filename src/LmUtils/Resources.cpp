// Resource modules and language selection.
#include "owutils/LmResources.h"

#include "ErrorHandler/Reporting.h"
#include "LmUtils/ResourceState.h"
#include "owutils/Application.h"
#include "owutils/Exceptions.h"
#include "owutils/Paths.h"
#include "platform/Locale.h"
#include "platform/Modules.h"
#include "owutils/Registry.h"

namespace LmUtils {

HINSTANCE g_hAppResources = nullptr;
HINSTANCE g_hEngineResources = nullptr;
HINSTANCE g_hLFResources = nullptr;
HINSTANCE g_hMessageResources = nullptr;
CString g_strMessageModuleName;
_tagSYSOEM* g_pOEMData = nullptr;
_tagOEMEmailInfo* g_pOEMEmailInfo = nullptr;
bool g_bResourceFallbackReported = false;

namespace {

CString g_strResourceDirectoryOverride;

// The parts of the product's registry key, as the build defines them (possibly quoted).
constexpr const char16_t* kCompanyName = u"Orbis Works";
constexpr const char16_t* kProductName = u"Orbis Agent";
constexpr const char16_t* kLanguageValue = u"LanguageId";
constexpr LANGID kEnglish = 0x409;

struct SupportedLanguage {
  LANGID id;
  const char16_t* code;
};

constexpr SupportedLanguage kSupportedLanguages[] = {
    {0x404, u"cht"}, {0x407, u"deu"}, {0x409, u"enu"}, {0x40A, u"esp"},
    {0x40C, u"fra"}, {0x410, u"ita"}, {0x411, u"jpn"}, {0x412, u"kor"},
    {0x416, u"por"}, {0x419, u"rus"}, {0x41F, u"tur"}, {0x804, u"chs"},
};

const SupportedLanguage* FindSupported(LANGID id) {
  for (const SupportedLanguage& language : kSupportedLanguages) {
    if (language.id == id) return &language;
  }
  return nullptr;
}

CString ProductKeyPath() {
  CString company(kCompanyName);
  CString product(kProductName);
  company.Trim(u'"');
  product.Trim(u'"');
  CString path(u"Software\\");
  path += company;
  path += u"\\";
  path += company;
  path += u" ";
  path += product;
  return path;
}

// The directory the modules lie in: the directory of this library's own file.
CString ResourceDirectory() {
  if (!g_strResourceDirectoryOverride.IsEmpty()) return g_strResourceDirectoryOverride;
  return Application::GetModuleLongDirectory(nullptr);
}

CString ModuleFileName(const CString& baseName, LANGID language) {
  CString name;
  name.Format(u"OW%s%x%s", baseName.GetString(), static_cast<unsigned>(language),
              Platform::ModuleFileSuffix());
  return name;
}

void MakeCurrent(HINSTANCE module) { Platform::SetResourceHandle(module); }

}  // namespace

namespace detail {

void SetResourceDirectoryForTesting(const CString& directory) {
  g_strResourceDirectoryOverride = directory;
}

void ResetResourceStateForTesting() {
  g_hAppResources = nullptr;
  g_hEngineResources = nullptr;
  g_hLFResources = nullptr;
  g_hMessageResources = nullptr;
  g_strMessageModuleName.Empty();
  g_pOEMData = nullptr;
  g_pOEMEmailInfo = nullptr;
  g_bResourceFallbackReported = false;
  Platform::SetResourceHandle(nullptr);
}

}  // namespace detail
}  // namespace LmUtils

using namespace LmUtils;

unsigned short GetAppLangFromRegistry() {
  HKEY key = nullptr;
  DWORD value = 0;
  if (Platform::RegOpenKeyExW(HKEY_LOCAL_MACHINE, ProductKeyPath().GetString(), 0, KEY_QUERY_VALUE,
                              &key) == ERROR_SUCCESS) {
    DWORD size = sizeof(value);
    // The type is neither asked for nor checked: the low 16 bits of whatever the value holds.
    Platform::RegQueryValueExW(key, kLanguageValue, nullptr, nullptr, reinterpret_cast<BYTE*>(&value),
                               &size);
    Platform::RegCloseKey(key);
  }
  return static_cast<unsigned short>(value & 0xFFFF);
}

unsigned short GetLanguageId() {
  LANGID language = GetAppLangFromRegistry();
  if (language == 0) {
    language = Platform::GetUserDefaultUILanguage();
    if (!Platform::IsValidLocale(language, Platform::kLcidInstalled)) language = kEnglish;
  }
  return FindSupported(language) != nullptr ? language : kEnglish;
}

const char16_t* GetLanguageIdString() { return FindSupported(GetLanguageId())->code; }

bool LoadResourceModule(const CString& baseName, HINSTANCE* module, CString& fileName) {
  try {
    PRECONDITION(module != NULL);
    CString directory = ResourceDirectory();
    CString name = ModuleFileName(baseName, GetLanguageId());
    CString path = Paths::Combine(directory, name);
    HINSTANCE loaded = Platform::LoadLibraryW(path.GetString());
    if (loaded != nullptr) {
      *module = loaded;
      fileName = name;
      return true;
    }
    if (!g_bResourceFallbackReported) {
      CString text;
      text.Format(u"Unable to load resource file %s, defaulting to English", path.GetString());
      LumoException::detail::ReportWarningToEventHandler(text.GetString());
      g_bResourceFallbackReported = true;
    }
    name = ModuleFileName(baseName, kEnglish);
    loaded = Platform::LoadLibraryW(Paths::Combine(directory, name).GetString());
    if (loaded != nullptr) {
      *module = loaded;
      fileName = name;
      return true;
    }
    THROW_AT(LumoException::Win32Error(u"LoadLibrary"));
  } catch (LumoException::Exception& e) {
    LumoException::detail::ReportToEventHandler(e, u"LoadResourceModule");
    return false;
  }
}

bool LoadEngineResources() {
  if (g_hEngineResources != nullptr) {
    MakeCurrent(g_hEngineResources);
    return true;
  }
  CString name;
  if (!LoadResourceModule(u"EngineRes", &g_hEngineResources, name)) return false;
  g_pOEMData = static_cast<_tagSYSOEM*>(Platform::GetProcAddress(g_hEngineResources, "__OEMData"));
  g_pOEMEmailInfo =
      static_cast<_tagOEMEmailInfo*>(Platform::GetProcAddress(g_hEngineResources, "__OEMEmailInfo"));
  if (g_pOEMData == nullptr || g_pOEMEmailInfo == nullptr) {
    g_pOEMData = nullptr;
    g_pOEMEmailInfo = nullptr;
    Platform::FreeLibrary(g_hEngineResources);
    g_hEngineResources = nullptr;
    return false;
  }
  MakeCurrent(g_hEngineResources);
  return true;
}

bool LoadAppResources(const char16_t* baseName) {
  if (g_hAppResources == nullptr) {
    if (!LoadEngineResources()) return false;
    CString name;
    if (!LoadResourceModule(baseName != nullptr ? CString(baseName) : CString(u"AppRes"),
                            &g_hAppResources, name)) {
      return false;
    }
  }
  MakeCurrent(g_hAppResources);
  return true;
}

bool LoadLFResources() {
  if (g_hLFResources == nullptr) {
    if (!LoadEngineResources()) return false;
    CString name;
    if (!LoadResourceModule(u"LFRes", &g_hLFResources, name)) return false;
  }
  MakeCurrent(g_hLFResources);
  return true;
}

bool LoadMessageResources() {
  if (g_hMessageResources != nullptr) return true;
  return LoadResourceModule(u"AppMsg", &g_hMessageResources, g_strMessageModuleName);
}

HINSTANCE GetAppResourceHandle() {
  ASSERTION(g_hAppResources != NULL);
  return g_hAppResources;
}

HINSTANCE GetEngineResourceHandle() {
  ASSERTION(g_hEngineResources != NULL);
  return g_hEngineResources;
}

namespace {

// The engine module, loading it when it is not loaded yet; null when it cannot be loaded.
HINSTANCE EngineModule() {
  if (g_hEngineResources == nullptr) LoadEngineResources();
  return g_hEngineResources;
}

// String `id` of `module` into `text`; false (text untouched) when there is none.
bool LoadModuleString(HINSTANCE module, int id, CString& text) {
  const char16_t* resource = nullptr;
  int length = Platform::LoadStringW(module, static_cast<UINT>(id),
                                     reinterpret_cast<char16_t*>(&resource), 0);
  if (length <= 0 || resource == nullptr) return false;
  text = CString(resource, length);
  return true;
}

}  // namespace

CString LVXSS_get(int id) {
  CString text;
  if (HINSTANCE module = EngineModule()) LoadModuleString(module, id, text);
  return text;
}

void LVXSS_get(int id, CString& text) {
  if (HINSTANCE module = EngineModule()) LoadModuleString(module, id, text);
}

void LVXSS_get(int id, char16_t* buffer, int size) {
  // Nothing can be written safely into a missing buffer or one without room for a terminator.
  if (buffer == nullptr || size < 1) return;
  buffer[0] = 0;
  if (HINSTANCE module = EngineModule()) Platform::LoadStringW(module, static_cast<UINT>(id), buffer, size);
}

HINSTANCE AfxGetResourceHandle() { return Platform::GetResourceHandle(); }

void AfxSetResourceHandle(HINSTANCE module) { Platform::SetResourceHandle(module); }
