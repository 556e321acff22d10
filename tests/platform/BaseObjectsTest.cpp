// Result codes, the base object, error objects and the per-thread last-error registry, the
// fatal-error hook and the recursive mutex.
#include "FatalRecorder.h"
#include "VLXBaseUnknown.h"
#include "VLXError.h"
#include "VLXMutex.h"
#include "VLXResult.h"

#include <gtest/gtest.h>

#include <atomic>
#include <new>
#include <typeinfo>
#include <thread>
#include <vector>

namespace {

std::atomic<int> g_destroyed{0};

namespace shapes {
struct Counted : VLXBaseUnknown {
  ~Counted() override { ++g_destroyed; }
};
struct Mixin {
  virtual ~Mixin() = default;
};
struct Derived : Counted, Mixin {};
}  // namespace shapes

struct CountedError : VLXError {
  using VLXError::VLXError;
  ~CountedError() override { ++g_destroyed; }
};

TEST(ResultCodes, FailuresAreNegativeLongsOnThisPlatform)
{
  for (long code : {VLX_E_FAIL, VLX_E_INVALIDARG, VLX_E_OUTOFMEMORY, VLX_E_NOTIMPL, VLX_E_NOINTERFACE}) {
    EXPECT_LT(code, 0) << std::hex << code;
    EXPECT_TRUE(VLX_FAILED(code) && !VLX_SUCCEEDED(code)) << std::hex << code;
  }
  EXPECT_EQ(VLX_E_FAIL, -2147467259L);
  EXPECT_TRUE(VLX_SUCCEEDED(VLX_S_OK) && VLX_SUCCEEDED(1));
}

// ---- base object ----

TEST(BaseUnknown, TheLastReleaseDeletesEvenUnderConcurrentAddRefAndRelease)
{
  g_destroyed = 0;
  shapes::Counted* object = new shapes::Counted;
  EXPECT_EQ(object->GetRefCount(), 1u);
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t)
    threads.emplace_back([object] {
      for (int i = 0; i < 100000; ++i) {
        object->AddRef();
        object->Release();
      }
    });
  for (std::thread& t : threads) t.join();
  EXPECT_EQ(object->AddRef(), 2u);
  EXPECT_EQ(object->Release(), 1u);
  EXPECT_EQ(g_destroyed, 0);
  EXPECT_EQ(object->Release(), 0u);
  EXPECT_EQ(g_destroyed, 1);

  shapes::Counted original;  // copies have a count of their own
  original.AddRef();
  shapes::Counted copy(original);
  EXPECT_EQ(copy.GetRefCount(), 1u);
  copy = original;
  EXPECT_EQ(copy.GetRefCount(), 1u);
}

TEST(BaseUnknown, ClassNamesAndInterfacesComeFromTheDynamicType)
{
  shapes::Derived object;
  VLXBaseUnknown* base = &object;
  const struct {
    const char* name;
    int isA, kindOf;
  } names[] = {{"(anonymous namespace)::shapes::Derived", 1, 1},
               {"(anonymous namespace)::shapes::Counted", 0, 1},
               {"(anonymous namespace)::shapes::Mixin", 0, 1},
               {"VLXBaseUnknown", 0, 1},
               {"VLXError", 0, 0},
               {nullptr, 0, 0}};
  for (const auto& n : names) {
    EXPECT_EQ(base->IsA(n.name), n.isA) << (n.name ? n.name : "null");
    EXPECT_EQ(base->IsAKindOf(n.name), n.kindOf) << (n.name ? n.name : "null");
  }
  void* found = &found;
  EXPECT_EQ(base->QueryInterface(IID_VLXBaseUnknown, &found), VLX_S_OK);
  EXPECT_EQ(found, base);
  EXPECT_EQ(base->QueryInterface("(anonymous namespace)::shapes::Derived", &found), VLX_S_OK);
  EXPECT_EQ(base->GetRefCount(), 3u) << "a successful query adds a reference";
  VLXIID other = IID_VLXBaseUnknown;
  other.Data4[7] ^= 1;
  EXPECT_EQ(base->QueryInterface(other, &found), VLX_E_NOINTERFACE);
  EXPECT_EQ(found, nullptr);
  EXPECT_EQ(base->QueryInterface("Unknown", &found), VLX_E_NOINTERFACE);
  EXPECT_EQ(base->QueryInterface("VLXBaseUnknown", nullptr), VLX_E_INVALIDARG);
  EXPECT_EQ(base->GetRefCount(), 3u);
}

// The rest of the base's contract: no scripting type information, an implementation pointer and a
// component state that are only stored, identity as equality, and the class allocator.
TEST(BaseUnknown, TypeInformationIsAbsentAndStoredStateIsKept)
{
  shapes::Counted object;
  unsigned int count = 7;
  void* info = &info;
  VLXIID iid = IID_VLXBaseUnknown;
  EXPECT_EQ(object.GetTypeInfoCount(&count), VLX_S_OK);
  EXPECT_EQ(count, 0u);
  EXPECT_EQ(object.GetTypeInfoCount(nullptr), VLX_E_INVALIDARG);
  EXPECT_EQ(object.GetTypeInfo(0, 0, &info), VLX_E_NOTIMPL);
  EXPECT_EQ(info, nullptr);
  EXPECT_EQ(object.GetIDsOfNames(iid, nullptr, 0, 0, nullptr), VLX_E_NOTIMPL);
  EXPECT_EQ(object.Invoke(0, iid, 0, 0, nullptr, nullptr, nullptr, nullptr), VLX_E_NOTIMPL);
  EXPECT_EQ(object.GetImpl(), nullptr);
  object.SetImpl(&count);
  EXPECT_EQ(object.GetImpl(), &count);
  EXPECT_EQ(object.IsNull(), 0);
  EXPECT_TRUE(object.IsEqual(&object));
  shapes::Counted other;
  EXPECT_FALSE(object.IsEqual(&other));
  EXPECT_EQ(object.ChangeComponentState(3), VLX_S_OK);
  EXPECT_EQ(object.GetComponentState(), 3);
  EXPECT_EQ(object.GetMetaObject(), typeid(shapes::Counted));
  VLXBaseUnknown* made = new (std::nothrow) shapes::Counted;  // the class allocator, nothrow form
  ASSERT_NE(made, nullptr);
  made->Release();
}

// ---- errors ----

class ErrorRegistry : public ::testing::Test {
 protected:
  void SetUp() override
  {
    VLXError::VLXCleanLastError();
    g_destroyed = 0;
    static const VLXMessageEntry entries[] = {
        {"T_1", "cannot open /p1 for /p2"},
        {"T_2", "no parameters here, only a path /proc and /p"},
        {"T_3", "ten: /p10, one: /p1, missing: [/p3]"},
    };
    VLXError::RegisterCatalog("TestCatalog", entries, 3);
  }
  void TearDown() override { VLXError::VLXCleanLastError(); }

  static std::string Text(const VLXError& e)
  {
    const VLXUnicodeString t = e.GetMessageText();
    return std::string(t.c_str(), static_cast<size_t>(t.GetLengthInByte()));
  }
};

TEST_F(ErrorRegistry, MessageTextsFillTheParametersIntoTheCatalogText)
{
  VLXUnicodeString params[10];
  for (int i = 0; i < 10; ++i) params[i] = ("p" + std::to_string(i + 1)).c_str();
  params[2] = VLXUnicodeString("with\0nul", 8);
  const struct {
    const char* id;
    const char* catalog;
    int count;
    std::string text;
  } cases[] = {
      {"T_1", "TestCatalog", 2, "cannot open p1 for p2"},
      {"T_2", "TestCatalog", 0, "no parameters here, only a path /proc and /p"},
      {"T_3", "TestCatalog", 2, "ten: , one: p1, missing: []"},
      {"T_3", "TestCatalog", 10, std::string("ten: p10, one: p1, missing: [with\0nul]", 38)},
      {"X_9", "NoSuchCatalog", 2, "NoSuchCatalog:X_9 (p1, p2)"},
      {"T_404", "TestCatalog", 0, "TestCatalog:T_404"},
  };
  for (const auto& c : cases) {
    VLXError e(c.id, c.catalog);
    e.SetNLSRequestParams(c.count, params);
    EXPECT_EQ(Text(e), c.text) << c.id << " with " << c.count;
    EXPECT_EQ(e.GetNLSParameterCount(), c.count);
  }
  FatalRecorder recorder;
  VLXError e("T_1", "TestCatalog");
  EXPECT_STREQ(e.GetNLSParameter(1).c_str(), "");
  EXPECT_EQ(FatalRecorder::Reports().size(), 1u) << "parameter out of range";
  e.SetNLSRequestParams(3, nullptr);
  EXPECT_EQ(e.GetNLSParameterCount(), 0);
  EXPECT_STREQ(VLXError(nullptr, nullptr).GetId(), "");
}

TEST_F(ErrorRegistry, GetReturnRecordsOnlyKindTwoAndTakesOverTheReference)
{
  EXPECT_EQ(VLXError::GetReturn(1, nullptr, nullptr, __FILE__, __LINE__), VLX_S_OK);
  EXPECT_EQ(VLXError::GetReturn(2, nullptr, nullptr, __FILE__, __LINE__), VLX_E_FAIL);
  CountedError* e = new CountedError("T_1", "TestCatalog");
  EXPECT_EQ(VLXError::GetReturn(7, e, nullptr, "f", 1), VLX_E_INVALIDARG);
  EXPECT_EQ(VLXError::GetReturn(1, e, nullptr, "f", 1), VLX_S_OK);
  EXPECT_EQ(VLXError::VLXGetLastError(0, nullptr), nullptr) << "nothing recorded so far";
  EXPECT_EQ(e->GetRefCount(), 1u);
  EXPECT_EQ(VLXError::GetReturn(2, e, nullptr, "here.cpp", 42), VLX_E_FAIL);
  EXPECT_STREQ(e->GetSourceFile(), "here.cpp");
  EXPECT_EQ(e->GetSourceLine(), 42);
  EXPECT_EQ(e->GetRefCount(), 1u) << "the registry took over the caller's reference";

  VLXError* got = VLXError::VLXGetLastError(0, nullptr);
  ASSERT_EQ(got, e);
  EXPECT_EQ(e->GetRefCount(), 2u);
  VLXError::VLXCleanLastError();
  EXPECT_EQ(e->GetRefCount(), 1u);
  EXPECT_EQ(VLXError::VLXGetLastError(0, nullptr), nullptr);
  VLXError::GetReturn(2, got, nullptr, __FILE__, __LINE__);  // re-raise after a clean
  EXPECT_EQ(e->GetRefCount(), 1u);
  VLXError::GetReturn(2, VLXError::VLXGetLastError(0, nullptr), nullptr, __FILE__, __LINE__);  // without one
  EXPECT_EQ(e->GetRefCount(), 1u);
  EXPECT_EQ(g_destroyed, 0);
  VLXError::GetReturn(2, new CountedError("T_2", "TestCatalog"), nullptr, __FILE__, __LINE__);
  EXPECT_EQ(g_destroyed, 1) << "a new error replaces and releases the previous one";
  VLXError::VLXCleanLastError();
  EXPECT_EQ(g_destroyed, 2);
  VLXError::VLXCleanLastError();  // nothing left: harmless
}

TEST_F(ErrorRegistry, LastErrorIsPerThreadAndReleasedAtThreadExit)
{
  CountedError* mine = new CountedError("T_1", "TestCatalog");
  VLXError::GetReturn(2, mine, nullptr, __FILE__, __LINE__);
  VLXError* sawBefore = mine;
  std::string sawOwn;
  std::thread([&] {
    sawBefore = VLXError::VLXGetLastError(0, nullptr);
    VLXError::GetReturn(2, new CountedError("T_2", "TestCatalog"), nullptr, __FILE__, __LINE__);
    if (VLXError* own = VLXError::VLXGetLastError(0, nullptr)) {
      sawOwn = own->GetId();
      own->Release();
    }
  }).join();
  EXPECT_EQ(sawBefore, nullptr) << "another thread's error is not this one's";
  EXPECT_EQ(sawOwn, "T_2");
  EXPECT_EQ(g_destroyed, 1) << "the thread's last error was released when it exited";
  VLXError* still = VLXError::VLXGetLastError(0, nullptr);
  EXPECT_EQ(still, mine) << "the other thread did not replace this one's";
  if (still != nullptr) still->Release();
}

// ---- fatal errors ----

void Other(const char*, const char*, int) {}

TEST(FatalError, HandlersSeeMessageDetailsFileAndLineAndNullRestoresTheDefault)
{
  {
    FatalRecorder recorder;
    VLXFatalError("AssertionFailed: x > 0", nullptr, nullptr, nullptr, "Tessara\\src\\Unit", 120);
    VLXFatalError("AssertionFailed: y", "first", nullptr, "third", nullptr, 7);
    ASSERT_EQ(FatalRecorder::Reports().size(), 2u);
    EXPECT_EQ(FatalRecorder::Reports()[0].message, "AssertionFailed: x > 0");
    EXPECT_EQ(FatalRecorder::Reports()[0].file, "Tessara\\src\\Unit");
    EXPECT_EQ(FatalRecorder::Reports()[0].line, 120);
    EXPECT_EQ(FatalRecorder::Reports()[1].message, "AssertionFailed: y first third");
  }
  const VLXFatalErrorHandler original = VLXSetFatalErrorHandler(&Other);
  ASSERT_NE(original, nullptr);
  EXPECT_EQ(VLXSetFatalErrorHandler(nullptr), &Other);
  EXPECT_EQ(VLXSetFatalErrorHandler(original), original) << "null installed the default again";
}

TEST(FatalErrorDeathTest, DefaultHandlerPrintsAndAborts)
{
  EXPECT_DEATH(VLXFatalError("AssertionFailed: broken", nullptr, nullptr, nullptr, "unit.cpp", 33),
               "AssertionFailed: broken.*unit.cpp:33");
}

// ---- mutex ----

TEST(Mutex, IsRecursiveAndExcludesOtherThreadsUntilFullyUnlocked)
{
  VLXMutex mutex(0, 0, 0);
  auto otherCanTake = [&mutex] {
    int got = 0;
    std::thread([&] {
      if ((got = mutex.TryLock()) != 0) mutex.Unlock();
    }).join();
    return got;
  };
  mutex.Lock();
  mutex.Lock();
  EXPECT_EQ(mutex.TryLock(), 1);
  EXPECT_EQ(otherCanTake(), 0);
  mutex.Unlock();
  mutex.Unlock();
  EXPECT_EQ(otherCanTake(), 0) << "still held once";
  mutex.Unlock();
  EXPECT_EQ(otherCanTake(), 1);
  FatalRecorder recorder;
  mutex.Unlock();
  EXPECT_EQ(FatalRecorder::Reports().size(), 1u) << "unlocked by a thread that does not hold it";
}

}  // namespace
