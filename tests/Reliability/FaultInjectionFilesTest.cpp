// Fault injection over the file operations: each platform call an operation makes is failed in
// turn (disk full, I/O error, access denied, an aborted call) or made to transfer less than
// asked, and the operation must report the failure the way it is documented to, never claim
// success for work it did not do, and never leave a file longer, shorter or half-written.
//
// A sweep arms one fault for the first matching call, runs the operation on fresh files, checks
// the outcome, then moves the fault one call further, until a run no longer reaches it.
#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <map>

#include "ReliabilitySupport.h"
#include "owutils/CEncrypt.h"
#include "owutils/Directories.h"
#include "owutils/Exceptions.h"
#include "owutils/Files.h"
#include "platform/Errors.h"
#include "platform/FaultInjection.h"

namespace FI = Platform::FaultInjection;

namespace {

struct Fault {
  const char* operation;
  DWORD error;      // 0: a short transfer
};

// The platform calls file operations make, each with the failures worth trying.
const std::vector<Fault>& Faults() {
  static const std::vector<Fault> faults = {
      {"CreateFile", ERROR_ACCESS_DENIED},    {"CreateFile", ERROR_DISK_FULL},
      {"ReadFile", ERROR_READ_FAULT},         {"ReadFile", ERROR_OPERATION_ABORTED},
      {"ReadFile", 0},                        {"WriteFile", ERROR_DISK_FULL},
      {"WriteFile", ERROR_WRITE_FAULT},       {"WriteFile", 0},
      {"SetFilePointer", ERROR_IO_DEVICE},    {"GetFileSize", ERROR_IO_DEVICE},
      {"FlushFileBuffers", ERROR_DISK_FULL},  {"SetEndOfFile", ERROR_DISK_FULL},
      {"CopyFile", ERROR_DISK_FULL},
      {"CopyFile", ERROR_ACCESS_DENIED},      {"CreateDirectory", ERROR_ACCESS_DENIED},
      {"CreateDirectory", ERROR_DISK_FULL},   {"GetFileAttributes", ERROR_IO_DEVICE},
      {"SetFileAttributes", ERROR_ACCESS_DENIED}, {"FindFirstFile", ERROR_IO_DEVICE},
      {"FindNextFile", ERROR_IO_DEVICE},      {"GetFileTime", ERROR_IO_DEVICE},
      {"SetFileTime", ERROR_ACCESS_DENIED},   {"GetFileInformationByHandle", ERROR_IO_DEVICE},
      {"DeleteFile", ERROR_ACCESS_DENIED},    {"MoveFile", ERROR_ACCESS_DENIED},
      {"CloseHandle", ERROR_IO_DEVICE},
  };
  return faults;
}

// Whether the run in progress reached its fault: set by Disarmed().
bool g_hit = false;

// Disarms the switch after an operation, noting whether it reached the fault.
bool Disarmed() {
  g_hit = FI::Hits() > 0;
  FI::Disarm();
  return g_hit;
}

std::string Describe(const Fault& fault, unsigned skip) {
  return std::string(fault.operation) + (fault.error == 0 ? " short" : " error " + std::to_string(fault.error)) +
         " at call " + std::to_string(skip + 1);
}

// Runs `attempt` with `fault` armed at call 1, 2, 3... until a run does not reach it. `attempt`
// gets a description for its messages; it reads FI::Hits() (whether the fault was reached)
// before it disarms. Returns how many runs reached the fault.
unsigned Sweep(const Fault& fault, const std::function<void(const std::string&)>& attempt) {
  unsigned reached = 0;
  for (unsigned skip = 0; skip < 400; ++skip) {
    FI::Disarm();
    if (fault.error == 0) {
      FI::ArmShort(fault.operation, 7, skip, 1);
    } else {
      FI::Arm(fault.operation, fault.error, skip, 1);
    }
    g_hit = false;
    attempt(Describe(fault, skip));
    FI::Disarm();
    if (!g_hit) break;
    ++reached;
    if (::testing::Test::HasFatalFailure()) break;
  }
  return reached;
}

class FaultInjectionFiles : public ::testing::Test {
 protected:
  void SetUp() override { m_dir = OwTest::MakeTempDirectory("fault"); }
  void TearDown() override { FI::Disarm(); }

  // A fresh folder for one run.
  std::string Fresh() { return m_dir + "/run" + std::to_string(m_runs++); }

  std::string m_dir;
  unsigned m_runs = 0;
};

constexpr size_t kChunk = CEncrypt::FILE_BUFFER_SIZE;

// The file must be made of whole chunks: a transformed prefix and an untouched rest, with
// exactly the original length. Returns how many chunks were transformed.
size_t CheckChunks(const OwTest::Bytes& onDisk, const OwTest::Bytes& before, const OwTest::Bytes& after,
                   const std::string& what) {
  EXPECT_EQ(onDisk.size(), before.size()) << what;
  if (onDisk.size() != before.size()) return 0;
  size_t transformed = 0;
  bool untouchedSeen = false;
  for (size_t start = 0; start < before.size(); start += kChunk) {
    const size_t end = std::min(before.size(), start + kChunk);
    const bool isBefore = std::equal(onDisk.begin() + start, onDisk.begin() + end, before.begin() + start);
    const bool isAfter = std::equal(onDisk.begin() + start, onDisk.begin() + end, after.begin() + start);
    EXPECT_TRUE(isBefore || isAfter) << what << ": chunk at " << start << " is half transformed";
    if (isAfter && !isBefore) {
      EXPECT_FALSE(untouchedSeen) << what << ": a transformed chunk after an untouched one";
      ++transformed;
    } else {
      untouchedSeen = true;
    }
  }
  return transformed;
}

TEST_F(FaultInjectionFiles, EncryptAndDecryptFileNeverLeaveHalfChunksOrClaimUndoneWork) {
  const OwTest::Bytes plain = OwTest::Pattern(3 * kChunk + 11);
  CEncrypt cipher(ENC_BLOWFISH, TRUE, CString(u"fault key"));
  OwTest::Bytes encrypted = plain;
  cipher.Encrypt(encrypted.data(), static_cast<int>(encrypted.size()));

  unsigned reached = 0;
  for (const Fault& fault : Faults()) {
    for (bool encrypt : {true, false}) {
      reached += Sweep(fault, [&](const std::string& what) {
        const std::string file = Fresh() + "/data.bin";
        const OwTest::Bytes& before = encrypt ? plain : encrypted;
        const OwTest::Bytes& after = encrypt ? encrypted : plain;
        OwTest::WriteNative(file, before);
        OwTest::ReportCapture reports;
        CEncrypt worker(ENC_BLOWFISH, TRUE, CString(u"fault key"));
        const BOOL ok = encrypt ? worker.EncryptFile(OwTest::LibraryPath(file)) : worker.DecryptFile(OwTest::LibraryPath(file));
        const bool hit = Disarmed();
        const OwTest::Bytes onDisk = OwTest::ReadNative(file);
        const std::string label = (encrypt ? "EncryptFile, " : "DecryptFile, ") + what;
        CheckChunks(onDisk, before, after, label);
        if (ok) {
          EXPECT_EQ(onDisk, after) << label << ": TRUE for a file not wholly processed";
        } else if (!ok) {
          EXPECT_TRUE(hit) << label;
          EXPECT_NE(reports.Text().find(u"unexpected failure"), std::u16string::npos) << label << ": no report";
        }
      });
    }
  }
  EXPECT_GT(reached, 10u);
}

// Found by the sweep above: EncryptFile stopped at the first read that returned less than a
// chunk and reported TRUE, although the rest of the file was never processed.
TEST_F(FaultInjectionFiles, ShortReadMidFileIsNotTakenForTheEnd) {
  const OwTest::Bytes plain = OwTest::Pattern(3 * kChunk + 11);
  OwTest::Bytes encrypted = plain;
  CEncrypt cipher(ENC_BLOWFISH, TRUE, CString(u"fault key"));
  cipher.Encrypt(encrypted.data(), static_cast<int>(encrypted.size()));
  const std::string file = Fresh() + "/data.bin";
  OwTest::WriteNative(file, plain);
  FI::ArmShort("ReadFile", 7, 0, 1);
  const BOOL ok = cipher.EncryptFile(OwTest::LibraryPath(file));
  FI::Disarm();
  const OwTest::Bytes onDisk = OwTest::ReadNative(file);
  EXPECT_TRUE(!ok || onDisk == encrypted) << "TRUE, but the file is not encrypted";
}

TEST_F(FaultInjectionFiles, DigestFileIsRightOrReportsTheFailure) {
  const OwTest::Bytes data = OwTest::Pattern(2 * kChunk + 5);
  CEncrypt reference(DIGEST_SHA1, TRUE);
  reference.Digest(data.data(), static_cast<int>(data.size()));
  const CString expected = reference.GetDigestResultString();

  unsigned reached = 0;
  for (const Fault& fault : Faults()) {
    reached += Sweep(fault, [&](const std::string& what) {
      const std::string file = Fresh() + "/digest.bin";
      OwTest::WriteNative(file, data);
      OwTest::ReportCapture reports;
      CEncrypt sha(DIGEST_SHA1, TRUE);
      const BOOL ok = sha.DigestFile(OwTest::LibraryPath(file));
      Disarmed();
      if (ok) {
        EXPECT_EQ(sha.GetDigestResultString(), expected) << "DigestFile, " << what << ": TRUE with a wrong digest";
      } else {
        EXPECT_NE(reports.Text().find(u"Unable to digest file"), std::u16string::npos) << "DigestFile, " << what;
      }
      EXPECT_EQ(OwTest::ReadNative(file), data) << what;
    });
  }
  EXPECT_GT(reached, 2u);
}

TEST_F(FaultInjectionFiles, CopyFileLeavesTheOldOrTheNewFileNeverAPart) {
  const OwTest::Bytes source = OwTest::Pattern(3 * 65536 + 123, 1);
  const OwTest::Bytes old = OwTest::Pattern(1000, 2);
  unsigned reached = 0;
  for (const Fault& fault : Faults()) {
    for (bool existing : {true, false}) {
      reached += Sweep(fault, [&](const std::string& what) {
        const std::string dir = Fresh();
        const std::string from = dir + "/in/source.bin", to = dir + "/out/sub/target.bin";
        OwTest::WriteNative(from, source);
        if (existing) OwTest::WriteNative(to, old);
        bool raised = false;
        try {
          Files::CopyFile(OwTest::LibraryPath(from), OwTest::LibraryPath(to));
        } catch (const UnableToCopyFile& e) {
          raised = true;
          EXPECT_NE(e.GetCause(), nullptr) << what;
        } catch (const LumoException::Exception& e) {
          ADD_FAILURE() << "CopyFile, " << what << ": " << OwTest::Narrow(e.ToString());
          raised = true;
        }
        Disarmed();
        const std::string label = std::string("CopyFile") + (existing ? " over a file, " : ", ") + what;
        EXPECT_EQ(OwTest::ReadNative(from), source) << label;
        const bool present = std::filesystem::exists(to);
        const OwTest::Bytes result = OwTest::ReadNative(to);
        if (!raised) {
          EXPECT_EQ(result, source) << label << ": reported success";
        } else if (present) {
          EXPECT_TRUE(result == source || (existing && result == old))
              << label << ": the target holds " << result.size() << " bytes";
        }
      });
    }
  }
  EXPECT_GT(reached, 3u);
}

TEST_F(FaultInjectionFiles, CopyDirectoryNeverLeavesAPartialFile) {
  const std::map<std::string, OwTest::Bytes> tree = {
      {"a.bin", OwTest::Pattern(70000, 3)},
      {"empty.bin", {}},
      {"sub/b.bin", OwTest::Pattern(5, 4)},
      {"sub/deeper/c.bin", OwTest::Pattern(20000, 5)},
  };
  unsigned reached = 0;
  for (const Fault& fault : Faults()) {
    reached += Sweep(fault, [&](const std::string& what) {
      const std::string dir = Fresh();
      for (const auto& [name, data] : tree) OwTest::WriteNative(dir + "/src/" + name, data);
      bool raised = false;
      try {
        Directories::CopyDirectory(OwTest::LibraryPath(dir + "/src"), OwTest::LibraryPath(dir + "/dst"));
      } catch (const UnableToCopyDirectory&) {
        raised = true;
      } catch (const LumoException::Exception& e) {
        ADD_FAILURE() << "CopyDirectory, " << what << ": " << OwTest::Narrow(e.ToString());
        raised = true;
      }
      Disarmed();
      for (const auto& [name, data] : tree) {
        EXPECT_EQ(OwTest::ReadNative(dir + "/src/" + name), data) << what;
        const std::string copy = dir + "/dst/" + name;
        if (!raised) {
          EXPECT_EQ(OwTest::ReadNative(copy), data) << "CopyDirectory, " << what << ": " << name;
        } else if (std::filesystem::exists(copy)) {
          EXPECT_EQ(OwTest::ReadNative(copy), data) << "CopyDirectory, " << what << ": partial " << name;
        }
      }
    });
  }
  EXPECT_GT(reached, 3u);
}

TEST_F(FaultInjectionFiles, CreateDirectoriesReportsWhatFailed) {
  unsigned reached = 0;
  for (const Fault& fault : Faults()) {
    if (fault.error == 0) continue;
    for (bool raising : {true, false}) {
      reached += Sweep(fault, [&](const std::string& what) {
        const std::string dir = Fresh() + "/a/b/c";
        const CString path = OwTest::LibraryPath(dir);
        bool ok = true;
        DWORD error = 0;
        if (raising) {
          try {
            Directories::CreateDirectories(path);
          } catch (const FileSystemException&) {
            ok = false;
          }
        } else {
          Platform::SetLastError(ERROR_SUCCESS);
          ok = Directories::TryCreateDirectories(path);
          error = Platform::GetLastError();
        }
        const bool hit = Disarmed();
        if (ok) {
          EXPECT_TRUE(std::filesystem::is_directory(dir)) << "CreateDirectories, " << what << ": reported success";
        } else {
          EXPECT_TRUE(hit) << what;
          if (!raising) {
            EXPECT_NE(error, static_cast<DWORD>(ERROR_SUCCESS)) << "TryCreateDirectories, " << what;
          }
        }
      });
    }
  }
  EXPECT_GT(reached, 2u);
}

}  // namespace
