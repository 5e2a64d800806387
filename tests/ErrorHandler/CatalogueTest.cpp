// Every class of the exception catalogue: type record, message, cause wrapping.
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <stdexcept>

#include "owutils/Exceptions.h"
#include "platform/Errors.h"
#include "support/TestEnvironment.h"

using LumoException::Exception;
using OwTest::Narrow;

namespace {

struct Row {
  std::function<Exception*()> make;
  std::function<Exception*(const Exception&)> makeWithCause;
  const char* module;
  const char* name;
  int code;
  std::string message;
};

#define ROW(Class, module, code, message, ...)                                                          \
  Row {                                                                                                 \
    [] { return static_cast<Exception*>(new Class(__VA_ARGS__)); },                                     \
        [](const Exception& cause) { return static_cast<Exception*>(new Class(__VA_ARGS__ __VA_OPT__(, ) cause)); }, \
        module, #Class, code, message                                                                   \
  }

class TextException : public CException {
 public:
  BOOL GetErrorMessage(char16_t* buffer, UINT maxChars, UINT*) const override {
    const std::u16string text = u"class library failure";
    text.copy(buffer, maxChars - 1);
    buffer[text.size()] = 0;
    return TRUE;
  }
};

const std::string kDenied = "error = 0x80070005, Access is denied.\r\n";

std::vector<Row> Catalogue() {
  static TextException classLibraryFailure;
  static std::runtime_error stdError("standard failure");
  static ComError comError(static_cast<HRESULT>(0x80070005u), u"desc", u"src");
  using namespace LumoException;
  return {
      ROW(AssertionFailed0, "Base", 1, "assertion violation for expression 'x'", u"x"),
      ROW(AssertionFailed1, "Base", 2, "assertion violation for expression 'x' with value '-3'", u"x", -3),
      ROW(AssertionFailed2, "Base", 3, "assertion violation for expression 'x' with value1 '1'  value2 '2'", u"x", 1, 2),
      ROW(PreconditionFailed0, "Base", 4, "precondition failed for expression 'p'", u"p"),
      ROW(PreconditionFailed1, "Base", 5, "precondition failed for expression 'p' with value '7'", u"p", 7),
      ROW(PreconditionFailed2, "Base", 6, "precondition failed for expression 'p' with value1 '7'  value2 '8'", u"p", 7, 8),
      ROW(UnhandledException, "Base", 7, "Caught an unhandled exception"),
      ROW(Win32ErrorCode, "Base", 8, "Function: CreateFile, " + kDenied, u"CreateFile", 5),
      ROW(SocketError, "Base", 9, "Function: connect, " + kDenied, u"connect", 5),
      ROW(BeginThreadFailure, "Base", 10, "Unable to start thread, error code 11, too many threads", 11),
      ROW(UnexpectedValue, "Base", 11, "Value '9' was not expected for version", u"version", 9),
      ROW(UnexpectedStringValue, "Base", 12, "Value 'v' was not expected for kind", u"kind", u"v"),
      ROW(NotImplemented, "Base", 13, "Sorting is not implemented", u"Sorting"),
      ROW(MemoryAllocationFailure, "Base", 14, "Unable to allocate 4096 bytes using new", size_t{4096}, u"new"),
      ROW(STLException, "Base", 100, "standard failure", stdError),
      ROW(MFCException, "Base", 101, "class library failure", &classLibraryFailure),
      ROW(COMException, "Base", 102, "Description: desc\nError: 0x80070005\nError Message: Access is denied.\nSource: src", comError),
      ROW(HResultException, "Base", 103, "Description: CoCreate, error = 0x80004005, Unspecified error.\r\n", u"CoCreate",
          static_cast<HRESULT>(0x80004005u)),
      ROW(StdFileError, "Base", 105,
          "Function 'fopen' failed for file 'a.txt', error 2: " + Narrow(Platform::ErrnoText(2)), u"fopen", u"a.txt", 2),
      ROW(BufferTooSmall, "Base", 1, "Buffer size 8192 is insufficient for requested data.", 8192),
      ROW(EventLogFailure, "Base", 2, "EventLog method 'ReadEventLog' failed, code: 5, message: " + kDenied, u"ReadEventLog", 5),
      ROW(PoolMgrException, "PoolMgr", 1, "pool text", CString(u"pool text")),
      ROW(PoolMgrUnableToCheckoutObject, "PoolMgr", 2, "Pool is empty"),
      ROW(PoolMgrFailedToCreateObject, "PoolMgr", 3, "Pool size too small"),
      ROW(RegistryOpenKeyException, "Registry", 4, "Failed to open key 'Software\\X'", CString(u"Software\\X")),
      ROW(VersionNumberException, "VersionNumber", 5, "bad version", CString(u"bad version")),
      ROW(CommandLineParserException, "Base", 6, "parse", u"parse"),
      ROW(ArgumentNotFound, "Base", 7, "Missing required argument -f", u"-f"),
      ROW(CommandNotFound, "Base", 8, "No command found at position 3", 3),
      ROW(Wow64Exception, "Wow64", 9, "Wow64DisableWow64FsRedirection failure", CString(u"Wow64DisableWow64FsRedirection")),
      ROW(RegSvr32Exception, "RegSvr32", 10, "reg", CString(u"reg")),
      ROW(ProcessManagerException, "ProcessManager", 11, "pm", CString(u"pm")),
      ROW(ProcessManagerCommandFailed, "ProcessManager", 12, "Could not execute command 'ls'", CString(u"ls")),
      ROW(ProcessManagerExecutionFailed, "ProcessManager", 13,
          "Could not execute operation 'open' with target 't', directory 'd' and arguments 'a'", CString(u"open"),
          CString(u"t"), CString(u"d"), CString(u"a")),
      ROW(ProcessManagerOperationCanceled, "ProcessManager", 14, "Execution of target 't' was canceled by the user", CString(u"t")),
      ROW(ProcessManagerCommandTimeout, "ProcessManager", 15, "Command 'c' did not complete within 30 seconds", CString(u"c"), 30),
      ROW(ProcessCtrlCHandlerException, "ProcessCtrlCHandler", 16, "ctrl", u"ctrl"),
      ROW(WindowsProfileException, "WindowsProfile", 17, "LoadUserProfile failure", CString(u"LoadUserProfile")),
      ROW(OSVersionException, "Base", 18, "Unable to determine operating system version"),
      ROW(FileSystemException, "Base", 19, "fs", u"fs"),
      ROW(FailedToGetDiskFreeSpaceEx, "Base", 20, "Unable to determine free space for path C:\\, " + kDenied, u"C:\\", 5),
      ROW(FileDoesNotExist, "Base", 21, "The file 'f' does not exist.", u"f"),
      ROW(FileExists, "Base", 22, "The file 'f' already exists.", u"f"),
      ROW(UnableToCreateDirectory, "Base", 23, "Unable to create directory 'd'", u"d"),
      ROW(UnableToOpenFile, "Base", 24, "Unable to open file 'f'", u"f"),
      ROW(InvalidUncPath, "Base", 25, "'\\\\x' is not a valid UNC path", u"\\\\x"),
      ROW(UnableToCopyFile, "Base", 26, "Unable to copy file from 'a' to 'b'", u"a", u"b"),
      ROW(UnableToSetWorkingDirectory, "Base", 27, "Unable to set current directory to 'd'", u"d"),
      ROW(UnableToDeleteFile, "Base", 28, "Unable to delete file 'f'", u"f"),
      ROW(UnableToDeleteFiles, "Base", 29, "Unable to delete '*.tmp' from directory 'd'", u"*.tmp", u"d"),
      ROW(UnableToDeleteDirectory, "Base", 30, "Unable to delete directory 'd'", u"d"),
      ROW(UnableToLoadLibrary, "Base", 31, "Unable to load library 'l'", u"l"),
      ROW(InvalidEncodingMode, "Base", 32,
          "Encoding mode: 'X' is invalid. Should be one of these: \"UTF-8\", \"UTF-16LE\", \"UNICODE\".", u"X"),
      ROW(UnableToMoveFile, "Base", 33, "Unable to move file from 'a' to 'b'", u"a", u"b"),
      ROW(NamedClientPipeException, "Base", 34, "pipe", u"pipe"),
      ROW(UnableToCopyDirectory, "Base", 35, "Unable to copy directory from 'a' to 'b'", u"a", u"b"),
      ROW(UnableToGetAttributes, "Base", 36, "Unable to get attributes for file 'f'", u"f"),
      ROW(UnableToSetAttributes, "Base", 37, "Unable to set attributes for file 'f'", u"f"),
      ROW(ServiceException, "Service", 38, "svc", u"svc"),
      ROW(ServiceInstallFailed, "Service", 39, "Unable to install service 's', name = 'n', path = p", u"s", u"n", u"p"),
      ROW(ServiceUninstallFailed, "Service", 40, "Unable to uninstall service 's'", u"s"),
      ROW(ServiceStopFailed, "Service", 41, "Unable to stop service 's', state = 3", u"s", 3),
      ROW(ServiceStartFailed, "Service", 42, "Unable to start service 's', state = 4", u"s", 4),
      ROW(ServiceModifyFailed, "Service", 43, "Unable to modify service 's'", u"s"),
      ROW(ServiceDatabaseLocked, "Service", 44, "locked", u"locked"),
      ROW(ServiceFunctionFailed, "Service", 45, "OpenService failed for service 's'", u"OpenService", u"s"),
      ROW(ProcessesException, "Processes", 46, "proc", u"proc"),
      ROW(ProcessesKillFailed, "Processes", 47, "Unable to kill process 'p'", CString(u"p")),
      ROW(ProcessesUnableToFindPID, "Processes", 48, "Unable to find PID for 'p'", CString(u"p")),
      ROW(LumoStringUnableToEncodeStringAsURI, "LumoString", 49, "Unable to encode string 't' as URI string.", u"t"),
      ROW(LumoStringUnableToDecodeStringFromURI, "LumoString", 50, "Unable to decode URI string 't'.", u"t"),
      ROW(LumoStringUnableToEncodeSpecialCharsInString, "LumoString", 51, "Unable to encode special characters in string 't'.", u"t"),
      ROW(LumoStringUnableToDecodeSpecialCharsInString, "LumoString", 52, "Unable to decode special characters in string 't'.", u"t"),
      ROW(LumoStringInvalidHexCharA, "LumoString", 53, "'g' is not a valid hexadecimal character.", 'g'),
      ROW(LumoStringInvalidHexCharW, "LumoString", 54, "'ĝ' is not a valid hexadecimal character.", u'ĝ'),
      ROW(LumoStringInvalidDecodedCharA, "LumoString", 55, "'\x01' is not a valid decoded character.", '\x01'),
      ROW(LumoStringInvalidDecodedCharW, "LumoString", 56, "'€' is not a valid decoded character.", u'€'),
      ROW(LumoStringResourceNotFound, "LumoString", 57, "Resource not found: 42", 42u),
      ROW(LumoStringNarrowToWideFailed, "LumoString", 58, "Unable to convert string to UTF-16"),
      ROW(LumoStringWideToNarrow, "LumoString", 59, "Unable to convert string from UTF-16"),
      ROW(ComGuidGenerationFailure, "Com", 60, "Unable to construct a new GUID"),
      ROW(ComInvalidFormatForGuid, "Com", 61, "'{x}' is not a valid format for a GUID.", u"{x}"),
      ROW(ComWrongVariantType, "Com", 62, "Expected type 8, found 3", 8u, VARTYPE{3}),
      ROW(NetworkResourceNameIsEmpty, "Network", 63, "Name of network resource to connect to is empty."),
      ROW(NetworkPathLengthLimitExceeded, "Network", 64,
          "Network resource path '\\\\srv\\share' must not exceed limit. Current length: 11, Maximum allowed: 10.",
          u"\\\\srv\\share", 10),
      ROW(NetworkSessionCredentialConflict, "Network", 65, "Unable to connect to network location: l. Error: e.", u"l", u"e"),
      ROW(NetworkConnectionFailure, "Network", 66, "Unable to connect to network location: l. Error: e.", u"l", u"e"),
      ROW(NetworkDisconnectionFailure, "Network", 67, "Unable to disconnect from network location: l. Error: e.", u"l", u"e"),
      ROW(EncryptionException, "Base", 1, "enc", u"enc"),
      ROW(UnknownEncryptionType, "Base", 2, "CEncrypt::Init: unknown encryption type 99", u"CEncrypt::Init", 99),
      ROW(UnableToDigestFile, "Base", 3, "Unable to digest file 'f'", u"f"),
  };
}

}  // namespace

TEST(Catalogue, EveryClassHasItsTypeRecordAndMessage) {
  for (const Row& row : Catalogue()) {
    SCOPED_TRACE(row.name);
    std::unique_ptr<Exception> e(row.make());
    EXPECT_EQ(Narrow(e->GetType().module), row.module);
    EXPECT_EQ(Narrow(e->GetType().name), row.name);
    EXPECT_EQ(e->GetType().code, row.code);
    EXPECT_EQ(Narrow(e->GetMessage()), row.message);
    EXPECT_EQ(Narrow(e->ToString()), "exception " + std::string(row.name) + " : " + row.message + "\n");
  }
}

TEST(Catalogue, EveryClassWrapsACauseAndClonesAsItself) {
  for (const Row& row : Catalogue()) {
    SCOPED_TRACE(row.name);
    LumoException::NotImplemented cause(u"inner");
    std::unique_ptr<Exception> e(row.makeWithCause(cause));
    EXPECT_TRUE(cause.IsPostCloned());
    ASSERT_NE(e->GetCause(), nullptr);
    EXPECT_EQ(Narrow(e->GetCause()->GetMessage()), "inner is not implemented");
    EXPECT_EQ(Narrow(e->GetMessage()), row.message);
    EXPECT_EQ(Narrow(e->GetRootCauseId()), "Base:13");
    std::unique_ptr<Exception> clone(e->Clone());
    EXPECT_EQ(Narrow(clone->GetType().name), row.name);
    EXPECT_EQ(Narrow(clone->GetMessage()), row.message);
    EXPECT_NE(clone->GetCause(), nullptr);
    EXPECT_TRUE(e->IsPostCloned());
  }
}

TEST(Catalogue, GroupsShareCodesButNotModuleAndName) {
  LumoException::AssertionFailed0 a(u"x");
  PoolMgrException p(CString(u"y"));
  LumoException::BufferTooSmall b(1);
  EncryptionException c(u"z");
  EXPECT_EQ(a.GetType().code, 1);
  EXPECT_EQ(p.GetType().code, 1);
  EXPECT_EQ(b.GetType().code, 1);
  EXPECT_EQ(c.GetType().code, 1);
  EXPECT_NE(Narrow(a.GetType().name), Narrow(b.GetType().name));
  EXPECT_NE(Narrow(p.GetType().module), Narrow(c.GetType().module));
}

TEST(Catalogue, IntermediateClassesCatchTheirFamilies) {
  EXPECT_THROW(THROW_AT(UnableToDeleteDirectory(u"d")), FileSystemException);
  EXPECT_THROW(THROW_AT(ServiceStopFailed(u"s", 1)), ServiceException);
  EXPECT_THROW(THROW_AT(CommandNotFound(2)), CommandLineParserException);
  EXPECT_THROW(THROW_AT(UnknownEncryptionType(u"f", 3)), EncryptionException);
  EXPECT_THROW(THROW_AT(UnableToDigestFile(u"f")), LumoException::Exception);
}

TEST(Catalogue, Win32ErrorTakesTheLastErrorAndSetsTheUserMessage) {
  Platform::SetLastError(ERROR_ACCESS_DENIED);
  LumoException::Win32Error e(u"CreateFileW");
  EXPECT_EQ(e.m_error, 5);
  EXPECT_EQ(Narrow(e.GetMessage()), "Function: CreateFileW, " + kDenied);
  EXPECT_EQ(Narrow(e.GetUserMessage()), "Access is denied.\r\n");
}

TEST(Catalogue, SystemErrorText) {
  EXPECT_EQ(Narrow(LumoException::SystemErrorText(5, true)), kDenied);
  EXPECT_EQ(Narrow(LumoException::SystemErrorText(5, false)), "Access is denied.\r\n");
  EXPECT_EQ(Narrow(LumoException::SystemErrorText(0, false)), "The operation succeeded.\r\n");
  EXPECT_EQ(Narrow(LumoException::SystemErrorText(0x7123, true)), "error = 0x80077123");
  EXPECT_EQ(Narrow(LumoException::SystemErrorText(-5, true)), "error = 0xFFFFFFFB");
}

TEST(Catalogue, ThreadFailureReasonsAndLongStandardTexts) {
  EXPECT_EQ(Narrow(LumoException::BeginThreadFailure(12).GetMessage()), "Unable to start thread, error code 12, unknown error");
  EXPECT_EQ(Narrow(LumoException::BeginThreadFailure(13).GetMessage()),
            "Unable to start thread, error code 13, insufficient resources");
  EXPECT_EQ(Narrow(LumoException::BeginThreadFailure(22).GetMessage()),
            "Unable to start thread, error code 22, invalid argument or the stack size is incorrect");
  std::string longText(600, 'q');
  LumoException::STLException e{std::runtime_error(longText)};
  EXPECT_EQ(e.GetMessage().size(), 511u);
}
