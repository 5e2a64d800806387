// The catalogue of the library's exception classes.
//
// Every class has a type record {module, name, code}, two constructors (its own arguments, and
// the same followed by the cause it wraps) and a message built at construction. Classes of the
// core group live in namespace LumoException; the utility and encryption classes in the global
// namespace. The rows are in owutils/ExceptionCatalogue.def.
//
//   try { Files::Copy(from, to); }
//   catch (LumoException::Exception& e) { THROW_AT(UnableToCopyDirectory(src, dst, e)); }
#pragma once

#include <exception>
#include <string>

#include "owutils/CString.h"
#include "owutils/Exception.h"
#include "owutils/ForeignExceptions.h"

namespace LumoException {

// The system's text for a Win32 error code: "error = 0x%08lX, <text>" with `withCode`, else the
// bare text (with the system's line end). A positive code is looked up as its HRESULT
// (code & 0xFFFF | 0x80070000); without a system text the result is "error = 0x%08lX".
OWUTILS_API Lumo::String SystemErrorText(int code, bool withCode);

namespace detail {
OWUTILS_API Lumo::String SystemValueText(DWORD value, bool withCode);
OWUTILS_API Lumo::String WidenBytes(const char* text, size_t maxLength);
OWUTILS_API Lumo::String ErrnoText(int error);
OWUTILS_API DWORD LastError() noexcept;
}  // namespace detail

}  // namespace LumoException

#define OW_UNPAREN_(...) __VA_ARGS__
#define OW_WITH_CAUSE_(...) __VA_ARGS__ __VA_OPT__(, ) const ::LumoException::Exception& cause

#define OW_DECLARE_EXCEPTION_(Class, Base, Module, Code, Params, Fields, Body)              \
  namespace ow_fields {                                                                    \
  struct OWUTILS_API Class {                                                               \
    Fields                                                                                 \
  };                                                                                       \
  }                                                                                        \
  class OWUTILS_API Class : public Base, public ow_fields::Class {                         \
   public:                                                                                 \
    explicit Class(OW_UNPAREN_ Params);                                                    \
    Class(OW_WITH_CAUSE_ Params);                                                          \
    Class(Class&& other);                                                                  \
    ~Class() override;                                                                     \
    const ::LumoException::ExceptionType& GetType() const override;                        \
    [[noreturn]] void Throw(const char16_t* file, int line) override;                      \
    Class* Clone() override;                                                               \
    static const ::LumoException::ExceptionType& StaticType();                             \
                                                                                           \
   protected:                                                                              \
    Class(::LumoException::detail::DeriveTag, const ::LumoException::Exception* cause);    \
  };

#define OW_CORE_EXCEPTION(...) OW_DECLARE_EXCEPTION_(__VA_ARGS__)
#define OW_UTILITY_EXCEPTION(...)
#define OW_ENCRYPTION_EXCEPTION(...)
namespace LumoException {
#include "owutils/ExceptionCatalogue.def"
}  // namespace LumoException
#undef OW_CORE_EXCEPTION
#undef OW_UTILITY_EXCEPTION
#undef OW_ENCRYPTION_EXCEPTION

#define OW_CORE_EXCEPTION(...)
#define OW_UTILITY_EXCEPTION(...) OW_DECLARE_EXCEPTION_(__VA_ARGS__)
#define OW_ENCRYPTION_EXCEPTION(...) OW_DECLARE_EXCEPTION_(__VA_ARGS__)
#include "owutils/ExceptionCatalogue.def"
#undef OW_CORE_EXCEPTION
#undef OW_UTILITY_EXCEPTION
#undef OW_ENCRYPTION_EXCEPTION
