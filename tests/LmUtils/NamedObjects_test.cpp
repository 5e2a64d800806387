// The named-object registry and the library frame's load-time state.
#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include "owutils/EventLogger.h"
#include "owutils/NamedObjects.h"

TEST(NamedObjects, DefaultLoggerIsRegisteredAndInstalledAtLoad) {
  void* handler = LmObjectGet(u"LM_EVENT_HANDLER");
  ASSERT_NE(handler, nullptr);
  auto* logger = static_cast<LumoException::EventLogger*>(handler);
  EXPECT_EQ(logger, LumoException::EventLogger::GetInstalledLogger());
  EXPECT_NE(dynamic_cast<LumoException::LmDefaultEventLogger*>(logger), nullptr);
}

TEST(NamedObjects, AddReplaceGetDelete) {
  int a = 0, b = 0;
  EXPECT_TRUE(LmObjectAdd(u"OWTest.Object", &a));
  EXPECT_TRUE(LmObjectAdd(u"OWTest.Object", &b));
  EXPECT_EQ(LmObjectGet(u"OWTest.Object"), &b);
  // Names keep their case.
  EXPECT_EQ(LmObjectGet(u"owtest.object"), nullptr);
  EXPECT_FALSE(LmObjectDel(u"OWTEST.OBJECT"));
  EXPECT_TRUE(LmObjectDel(u"OWTest.Object"));
  EXPECT_FALSE(LmObjectDel(u"OWTest.Object"));
  EXPECT_EQ(LmObjectGet(u"OWTest.Object"), nullptr);

  // A null pointer may be registered; it reads like a missing name.
  EXPECT_TRUE(LmObjectAdd(u"OWTest.Null", nullptr));
  EXPECT_EQ(LmObjectGet(u"OWTest.Null"), nullptr);
  EXPECT_TRUE(LmObjectDel(u"OWTest.Null"));
}

TEST(NamedObjects, EmptyAndNullNamesAreRefused) {
  int a = 0;
  EXPECT_FALSE(LmObjectAdd(u"", &a));
  EXPECT_FALSE(LmObjectAdd(nullptr, &a));
  EXPECT_EQ(LmObjectGet(u""), nullptr);
  EXPECT_EQ(LmObjectGet(nullptr), nullptr);
  EXPECT_FALSE(LmObjectDel(u""));
  EXPECT_FALSE(LmObjectDel(nullptr));
}

TEST(NamedObjects, CountedLockIsReentrantAndIgnoresStrayReleases) {
  LumoException::CountedLock lock;
  lock.Lock();
  lock.Lock();
  EXPECT_EQ(lock.GetDepth(), 2);
  std::thread other([&] {
    lock.Unlock();  // not the holder: does nothing
    EXPECT_EQ(lock.GetDepth(), 0);
  });
  other.join();
  EXPECT_EQ(lock.GetDepth(), 2);
  lock.Unlock();
  lock.Unlock();
  lock.Unlock();  // with the count at 0: nothing
  EXPECT_EQ(lock.GetDepth(), 0);
  std::thread taker([&] {
    lock.Lock();
    EXPECT_EQ(lock.GetDepth(), 1);
    lock.Unlock();
  });
  taker.join();
}

TEST(NamedObjects, ConcurrencyAddGetDeleteLosesNothing) {
  constexpr int kThreads = 4;
  constexpr int kNames = 200;
  std::vector<int> objects(kThreads * kNames);
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      for (int round = 0; round < 3; ++round) {
        for (int i = 0; i < kNames; ++i) {
          std::u16string name = u"OWTest.T" + std::u16string(1, static_cast<char16_t>(u'0' + t)) + u"." +
                                std::u16string(1, static_cast<char16_t>(u'A' + i % 26)) +
                                std::u16string(1, static_cast<char16_t>(u'a' + i / 26));
          void* mine = &objects[t * kNames + i];
          if (!LmObjectAdd(name.c_str(), mine)) ++failures;
          if (LmObjectGet(name.c_str()) != mine) ++failures;
          if (LmObjectGet(u"LM_EVENT_HANDLER") == nullptr) ++failures;
          if (round < 2 && !LmObjectDel(name.c_str())) ++failures;
        }
      }
    });
  }
  for (auto& thread : threads) thread.join();
  EXPECT_EQ(failures.load(), 0);
  // The last round's names are all still there.
  for (int t = 0; t < kThreads; ++t) {
    for (int i = 0; i < kNames; ++i) {
      std::u16string name = u"OWTest.T" + std::u16string(1, static_cast<char16_t>(u'0' + t)) + u"." +
                            std::u16string(1, static_cast<char16_t>(u'A' + i % 26)) +
                            std::u16string(1, static_cast<char16_t>(u'a' + i / 26));
      EXPECT_EQ(LmObjectGet(name.c_str()), &objects[t * kNames + i]);
      LmObjectDel(name.c_str());
    }
  }
}
