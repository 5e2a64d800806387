// The catalogue classes, defined from the rows of ExceptionCatalogue.def, and SystemErrorText.
#include "owutils/Exceptions.h"

#include "platform/Errors.h"

namespace LumoException {

Lumo::String detail::SystemValueText(DWORD value, bool withCode) {
  std::u16string system;
  Lumo::String text;
  if (!Platform::GetSystemMessage(value, system)) {
    text.Format(u"error = 0x%08lX", value);
  } else if (withCode) {
    text.Format(u"error = 0x%08lX, %s", value, system.c_str());
  } else {
    text = system;
  }
  return text;
}

Lumo::String SystemErrorText(int code, bool withCode) {
  DWORD value = code > 0 ? ((static_cast<DWORD>(code) & 0xFFFFu) | 0x80070000u) : static_cast<DWORD>(code);
  return detail::SystemValueText(value, withCode);
}

Lumo::String detail::WidenBytes(const char* text, size_t maxLength) {
  Lumo::String result;
  if (text == nullptr) return result;
  for (size_t i = 0; i < maxLength && text[i] != 0; ++i) {
    result.push_back(static_cast<char16_t>(static_cast<unsigned char>(text[i])));
  }
  return result;
}

Lumo::String detail::ErrnoText(int error) { return Lumo::String(Platform::ErrnoText(error)); }

DWORD detail::LastError() noexcept { return Platform::GetLastError(); }

}  // namespace LumoException

#define OW_DEFINE_EXCEPTION_(Class, Base, Module, Code, Params, Fields, Body)                        \
  Class::Class(OW_UNPAREN_ Params) : Base(::LumoException::detail::DeriveTag{}, nullptr) Body       \
  Class::Class(OW_WITH_CAUSE_ Params) : Base(::LumoException::detail::DeriveTag{}, &cause) Body     \
  Class::Class(::LumoException::detail::DeriveTag tag, const ::LumoException::Exception* cause)    \
      : Base(tag, cause) {}                                                                        \
  Class::Class(Class&& other)                                                                      \
      : Base(std::move(other)), ow_fields::Class(static_cast<const ow_fields::Class&>(other)) {}   \
  Class::~Class() = default;                                                                       \
  const ::LumoException::ExceptionType& Class::StaticType() {                                      \
    static constexpr ::LumoException::ExceptionType type{Module, u"" #Class, Code};                \
    return type;                                                                                   \
  }                                                                                                \
  const ::LumoException::ExceptionType& Class::GetType() const { return StaticType(); }            \
  void Class::Throw(const char16_t* file, int line) {                                              \
    RecordThrow(file, line);                                                                       \
    throw Class(std::move(*this));                                                                 \
  }                                                                                                \
  Class* Class::Clone() { return new Class(std::move(*this)); }

#define OW_CORE_EXCEPTION(...) OW_DEFINE_EXCEPTION_(__VA_ARGS__)
#define OW_UTILITY_EXCEPTION(...)
#define OW_ENCRYPTION_EXCEPTION(...)
namespace LumoException {
#include "owutils/ExceptionCatalogue.def"
}  // namespace LumoException
#undef OW_CORE_EXCEPTION
#undef OW_UTILITY_EXCEPTION
#undef OW_ENCRYPTION_EXCEPTION

#define OW_CORE_EXCEPTION(...)
#define OW_UTILITY_EXCEPTION(...) OW_DEFINE_EXCEPTION_(__VA_ARGS__)
#define OW_ENCRYPTION_EXCEPTION(...) OW_DEFINE_EXCEPTION_(__VA_ARGS__)
#include "owutils/ExceptionCatalogue.def"
