// File encryption in place and file digests, on files in the test's own temporary folder.
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "owutils/CEncrypt.h"
#include "owutils/Paths.h"
#include "platform/Debug.h"
#include "platform/FaultInjection.h"
#include "platform/Files.h"
#include "support/TestEnvironment.h"

namespace {

using Bytes = std::vector<BYTE>;

Bytes Pattern(size_t size) {
  Bytes data(size);
  for (size_t i = 0; i < size; ++i) data[i] = static_cast<BYTE>(i * 131 + i / 251);
  return data;
}

class FileTest : public ::testing::Test {
 protected:
  void SetUp() override {
    m_dir = OwTest::MakeTempDirectory("secure");
    Platform::SetOutputHook([this](const char*, const std::u16string& text) { m_reports += text; });
  }
  void TearDown() override {
    Platform::SetOutputHook({});
    Platform::FaultInjection::Disarm();
  }

  std::string Native(const std::string& name) const { return m_dir + "/" + name; }
  CString Path(const std::string& name) const { return Paths::FromNativePath(CString(OwTest::Widen(Native(name)))); }

  CString Write(const std::string& name, const Bytes& data) const {
    std::ofstream(Native(name), std::ios::binary).write(reinterpret_cast<const char*>(data.data()),
                                                         static_cast<std::streamsize>(data.size()));
    return Path(name);
  }
  Bytes Read(const std::string& name) const {
    std::ifstream in(Native(name), std::ios::binary);
    return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  }

  std::string m_dir;
  std::u16string m_reports;
};

// The file must hold exactly what Encrypt makes of the same bytes in memory.
TEST_F(FileTest, EncryptsWholeBlocksInPlaceAndDecryptRestores) {
  for (int type : {ENC_BLOWFISH, ENC_AES_128, ENC_RC5}) {
    for (size_t size : {size_t{20485}, size_t{3 * 20480 + 100}, size_t{20480}, size_t{7}, size_t{0}}) {
      const Bytes plain = Pattern(size);
      const CString path = Write("data.bin", plain);
      CEncrypt encryptor(type, TRUE, CString(u"file key"));
      ASSERT_TRUE(encryptor.EncryptFile(path)) << OwTest::Narrow(m_reports);

      Bytes expected = plain;
      if (size > 0) encryptor.Encrypt(expected.data(), static_cast<int>(size));
      const Bytes onDisk = Read("data.bin");
      ASSERT_EQ(onDisk.size(), size);
      EXPECT_EQ(onDisk, expected) << "type " << type << " size " << size;
      if (size >= 8) EXPECT_NE(onDisk, plain);
      if (size == 20485) EXPECT_TRUE(std::equal(plain.end() - 5, plain.end(), onDisk.end() - 5));

      CEncrypt other(type, TRUE, CString(u"file key"));
      ASSERT_TRUE(other.DecryptFile(path));
      EXPECT_EQ(Read("data.bin"), plain);
    }
  }
  EXPECT_TRUE(m_reports.empty());
}

TEST_F(FileTest, FailuresReportAndLeaveTheFileAlone) {
  const Bytes plain = Pattern(50000);
  const CString path = Write("data.bin", plain);
  CEncrypt aes(ENC_AES_256, TRUE, CString(u"k"));

  EXPECT_FALSE(aes.EncryptFile(Path("missing.bin")));
  EXPECT_NE(m_reports.find(u"unexpected failure"), std::u16string::npos);
  m_reports.clear();

  EXPECT_FALSE(aes.EncryptFile(CString()));
  EXPECT_NE(m_reports.find(u"!strFile.IsEmpty()"), std::u16string::npos);

  CEncrypt digest(DIGEST_SHA1, TRUE);
  EXPECT_FALSE(digest.EncryptFile(path));
  EXPECT_FALSE(digest.DecryptFile(path));

  // Read-only.
  ASSERT_TRUE(Platform::SetFileAttributesW(path.GetString(), FILE_ATTRIBUTE_READONLY));
  m_reports.clear();
  EXPECT_FALSE(aes.EncryptFile(path));
  EXPECT_FALSE(m_reports.empty());
  ASSERT_TRUE(Platform::SetFileAttributesW(path.GetString(), FILE_ATTRIBUTE_NORMAL));

  // Held open by another opener: the exclusive open is refused.
  HANDLE other = Platform::CreateFileW(path.GetString(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                                       FILE_ATTRIBUTE_NORMAL, nullptr);
  ASSERT_NE(other, INVALID_HANDLE_VALUE);
  EXPECT_FALSE(aes.EncryptFile(path));
  Platform::CloseHandle(other);
  EXPECT_EQ(Read("data.bin"), plain);
}

TEST_F(FileTest, FailedWritesNeverLeaveAHalfChunkOrChangeTheLength) {
  const Bytes plain = Pattern(3 * 20480 + 11);
  CEncrypt bf(ENC_BLOWFISH, TRUE, CString(u"k"));
  Bytes firstChunkEncrypted = plain;
  bf.Encrypt(firstChunkEncrypted.data(), 20480);

  // Disk full on the second chunk: the first is encrypted, the rest untouched.
  CString path = Write("full.bin", plain);
  {
    Platform::FaultInjection::ScopedFault fault("WriteFile", ERROR_DISK_FULL, 1);
    EXPECT_FALSE(bf.EncryptFile(path));
    EXPECT_EQ(Platform::FaultInjection::Hits(), 1u);
  }
  EXPECT_EQ(Read("full.bin"), firstChunkEncrypted);

  // A short write that claims success: the partly written chunk is put back.
  path = Write("short.bin", plain);
  m_reports.clear();
  Platform::FaultInjection::ArmShort("WriteFile", 100, 1);
  EXPECT_FALSE(bf.EncryptFile(path));
  Platform::FaultInjection::Disarm();
  EXPECT_EQ(Read("short.bin"), firstChunkEncrypted);
  EXPECT_FALSE(m_reports.empty());

  // A read error part-way.
  path = Write("read.bin", plain);
  {
    Platform::FaultInjection::ScopedFault fault("ReadFile", ERROR_READ_FAULT, 1);
    EXPECT_FALSE(bf.EncryptFile(path));
  }
  EXPECT_EQ(Read("read.bin"), firstChunkEncrypted);
}

TEST_F(FileTest, DigestFileMatchesTheBufferDigest) {
  const Bytes data = Pattern(5 * 20480 + 3);
  const CString path = Write("digest.bin", data);
  for (int type : {DIGEST_SHA1, DIGEST_RIPEMD160, DIGEST_MD5, DIGEST_CRC32}) {
    CEncrypt memory(type, TRUE);
    memory.Digest(data.data(), static_cast<int>(data.size()));
    CEncrypt file(type, TRUE);
    file.Digest(data.data(), 10);  // a file digest starts a new message
    ASSERT_TRUE(file.DigestFile(path));
    EXPECT_EQ(file.GetDigestResultString(), memory.GetDigestResultString()) << type;
  }
  CEncrypt crc(DIGEST_CRC32, TRUE);
  Write("check.txt", Bytes{'1', '2', '3', '4', '5', '6', '7', '8', '9'});
  ASSERT_TRUE(crc.DigestFile(Path("check.txt")));
  EXPECT_EQ(crc.GetDigestResultString(), CString(u"2639f4cb"));
}

TEST_F(FileTest, DigestFileFailuresReport) {
  CEncrypt sha(DIGEST_SHA1, TRUE);
  const CString missing = Path("missing.bin");
  EXPECT_FALSE(sha.DigestFile(missing));
  const std::u16string expected = u"Unable to digest file '" + missing.str() + u"'";
  EXPECT_NE(m_reports.find(expected), std::u16string::npos) << OwTest::Narrow(m_reports);
  EXPECT_NE(m_reports.find(u"CreateFile"), std::u16string::npos);

  const CString path = Write("data.bin", Pattern(100000));
  m_reports.clear();
  {
    Platform::FaultInjection::ScopedFault fault("ReadFile", ERROR_READ_FAULT, 2);
    EXPECT_FALSE(sha.DigestFile(path));
  }
  EXPECT_NE(m_reports.find(u"ReadFile"), std::u16string::npos);

  CEncrypt aes(ENC_AES_128, TRUE, CString(u"k"));
  EXPECT_FALSE(aes.DigestFile(path));
  BOOL first = TRUE, done = FALSE;
  EXPECT_FALSE(aes.DigestFileWTimeout(path, 10, &first, &done));
  EXPECT_TRUE(done);
}

TEST_F(FileTest, DigestInSlices) {
  const Bytes data = Pattern(40 * 20480 + 5);
  const CString path = Write("slices.bin", data);
  CEncrypt whole(DIGEST_MD5, TRUE);
  ASSERT_TRUE(whole.DigestFile(path));
  const CString expected = whole.GetDigestResultString();

  // A timeout already past ends each slice at the first look at the clock: after the 17th read
  // of the call, and every 16th read after that.
  CEncrypt md5(DIGEST_MD5, TRUE);
  BOOL first = TRUE, done = FALSE;
  int calls = 0;
  while (!done) {
    ASSERT_TRUE(md5.DigestFileWTimeout(path, -1, &first, &done));
    EXPECT_FALSE(first);
    ++calls;
  }
  EXPECT_EQ(calls, 3);  // 17 + 17 + 7 reads (the last one reads nothing)
  EXPECT_EQ(md5.GetDigestResultString(), expected);

  // One call when the timeout is not reached.
  first = TRUE;
  done = FALSE;
  ASSERT_TRUE(md5.DigestFileWTimeout(path, 3600, &first, &done));
  EXPECT_TRUE(done);
  EXPECT_EQ(md5.GetDigestResultString(), expected);
}

TEST_F(FileTest, SlicedDigestEdgesAndCleanup) {
  const CString empty = Write("empty.bin", Bytes{});
  CEncrypt sha(DIGEST_SHA1, TRUE);
  BOOL first = TRUE, done = FALSE;
  EXPECT_TRUE(sha.DigestFileWTimeout(empty, 5, &first, &done));
  EXPECT_TRUE(done);
  EXPECT_EQ(sha.GetDigestResultString(), CString(u"da39a3ee5e6b4b0d3255bfef95601890afd80709"));

  const CString path = Write("big.bin", Pattern(40 * 20480));
  auto exclusiveOpenWorks = [&] {
    HANDLE h = Platform::CreateFileW(path.GetString(), GENERIC_READ, 0, nullptr, OPEN_EXISTING,
                                     FILE_ATTRIBUTE_NORMAL, nullptr);
    if (h == INVALID_HANDLE_VALUE) return false;
    Platform::CloseHandle(h);
    return true;
  };

  // Abandoning with a timeout of 0 closes the file.
  first = TRUE;
  done = FALSE;
  ASSERT_TRUE(sha.DigestFileWTimeout(path, -1, &first, &done));
  ASSERT_FALSE(done);
  EXPECT_FALSE(exclusiveOpenWorks());
  EXPECT_TRUE(sha.DigestFileWTimeout(path, 0, &first, &done));
  EXPECT_TRUE(done);
  EXPECT_TRUE(exclusiveOpenWorks());

  // An instance destroyed in the middle of a sliced digest closes its file.
  {
    CEncrypt crc(DIGEST_CRC32, TRUE);
    first = TRUE;
    done = FALSE;
    ASSERT_TRUE(crc.DigestFileWTimeout(path, -1, &first, &done));
    ASSERT_FALSE(done);
    EXPECT_FALSE(exclusiveOpenWorks());
  }
  EXPECT_TRUE(exclusiveOpenWorks());

  // Missing file: reported, finished, FALSE.
  first = TRUE;
  done = FALSE;
  m_reports.clear();
  EXPECT_FALSE(sha.DigestFileWTimeout(Path("missing.bin"), 5, &first, &done));
  EXPECT_TRUE(done);
  EXPECT_NE(m_reports.find(u"Unable to digest file"), std::u16string::npos);
  EXPECT_FALSE(sha.DigestFileWTimeout(path, 5, nullptr, nullptr));
}

}  // namespace
