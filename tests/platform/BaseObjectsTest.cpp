// The base object, error objects and the per-thread last-error registry, the fatal-error hook and
// the recursive mutex.
#include "FatalRecorder.h"
#include "VLXBaseUnknown.h"
#include "VLXError.h"
#include "VLXMutex.h"
#include "VLXResult.h"

#include <gtest/gtest.h>

#include <atomic>
#include <condition_variable>
#include <cstddef>
#include <cstring>
#include <mutex>
#include <thread>
#include <vector>

namespace
{

std::atomic<int> g_destroyed{0};

namespace shapes
{
class Counted : public VLXBaseUnknown
{
public:
  ~Counted() override { ++g_destroyed; }
};
class Mixin
{
public:
  virtual ~Mixin() = default;
  int mixinValue = 0;
};
class Derived : public Counted, public Mixin
{
};
}

class CountedError : public VLXError
{
public:
  using VLXError::VLXError;
  ~CountedError() override { ++g_destroyed; }
};

// The byte offset recorded in an Itanium pointer to a virtual member function, as a slot number.
template <class F>
long Slot(F f)
{
  struct
  {
    std::ptrdiff_t ptr;
    std::ptrdiff_t adj;
  } rep;
  static_assert(sizeof(F) == sizeof(rep), "Itanium member function pointer expected");
  std::memcpy(&rep, &f, sizeof rep);
  EXPECT_EQ(rep.ptr & 1, 1) << "not a virtual function";
  return static_cast<long>((rep.ptr - 1) / static_cast<std::ptrdiff_t>(sizeof(void*)));
}

// ---- codes ----

TEST(ResultCodes, FailuresAreNegativeLongsOnThisPlatform)
{
  for (long code : {VLX_E_FAIL, VLX_E_INVALIDARG, VLX_E_OUTOFMEMORY, VLX_E_NOTIMPL, VLX_E_NOINTERFACE}) {
    EXPECT_LT(code, 0);
    EXPECT_TRUE(VLX_FAILED(code));
    EXPECT_FALSE(VLX_SUCCEEDED(code));
  }
  EXPECT_EQ(VLX_E_FAIL, -2147467259L);
  EXPECT_EQ(static_cast<unsigned int>(VLX_E_FAIL), 0x80004005u);
  EXPECT_TRUE(VLX_SUCCEEDED(VLX_S_OK));
  EXPECT_TRUE(VLX_SUCCEEDED(1));
  static_assert(sizeof(VLXBoolean) == 1, "one byte");
}

// ---- base object ----

TEST(BaseUnknown, VirtualFunctionsSitInTheirFixedSlots)
{
  typedef VLXBaseUnknown B;
  EXPECT_EQ(Slot(static_cast<long (B::*)(const VLXIID&, void**)>(&B::QueryInterface)), 0);
  EXPECT_EQ(Slot(&B::AddRef), 1);
  EXPECT_EQ(Slot(&B::Release), 2);
  EXPECT_EQ(Slot(&B::GetTypeInfoCount), 3);
  EXPECT_EQ(Slot(&B::GetTypeInfo), 4);
  EXPECT_EQ(Slot(&B::GetIDsOfNames), 5);
  EXPECT_EQ(Slot(&B::Invoke), 6);
  EXPECT_EQ(Slot(static_cast<long (B::*)(const char*, void**)>(&B::QueryInterface)), 7);
  // Slots 8 and 9: the two destructor entries.
  EXPECT_EQ(Slot(&B::GetMetaObject), 10);
  EXPECT_EQ(Slot(&B::IsA), 11);
  EXPECT_EQ(Slot(&B::IsAKindOf), 12);
  EXPECT_EQ(Slot(&B::GetImpl), 13);
  EXPECT_EQ(Slot(&B::SetImpl), 14);
  EXPECT_EQ(Slot(&B::IsNull), 15);
  EXPECT_EQ(Slot(&B::IsEqual), 16);
  EXPECT_EQ(Slot(&B::ChangeComponentState), 17);
}

TEST(BaseUnknown, HeapObjectStartsAtOneAndTheLastReleaseDeletesIt)
{
  g_destroyed = 0;
  shapes::Counted* object = new shapes::Counted;
  ASSERT_NE(object, nullptr);
  EXPECT_EQ(object->GetRefCount(), 1u);
  EXPECT_EQ(object->AddRef(), 2u);
  EXPECT_EQ(object->Release(), 1u);
  EXPECT_EQ(g_destroyed, 0);
  EXPECT_EQ(object->Release(), 0u);
  EXPECT_EQ(g_destroyed, 1);
}

TEST(BaseUnknown, ReferenceCountSurvivesConcurrentAddRefAndRelease)
{
  g_destroyed = 0;
  shapes::Counted* object = new shapes::Counted;
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t)
    threads.emplace_back([object] {
      for (int i = 0; i < 100000; ++i) {
        object->AddRef();
        object->Release();
      }
    });
  for (std::thread& t : threads)
    t.join();
  EXPECT_EQ(object->GetRefCount(), 1u);
  EXPECT_EQ(g_destroyed, 0);
  object->Release();
  EXPECT_EQ(g_destroyed, 1);
}

TEST(BaseUnknown, CopiesHaveTheirOwnCount)
{
  shapes::Counted original;
  original.AddRef();
  original.SetImpl(&original);
  shapes::Counted copy(original);
  EXPECT_EQ(copy.GetRefCount(), 1u);
  EXPECT_EQ(copy.GetImpl(), &original);
  copy = original;
  EXPECT_EQ(copy.GetRefCount(), 1u);
  original.Release();
}

TEST(BaseUnknown, InterfacesAndClassNamesComeFromTheDynamicType)
{
  g_destroyed = 0;
  shapes::Derived* object = new shapes::Derived;
  VLXBaseUnknown* base = object;
  EXPECT_EQ(base->IsA("(anonymous namespace)::shapes::Derived"), 1);
  EXPECT_EQ(base->IsA("(anonymous namespace)::shapes::Counted"), 0);
  EXPECT_EQ(base->IsAKindOf("(anonymous namespace)::shapes::Counted"), 1);
  EXPECT_EQ(base->IsAKindOf("(anonymous namespace)::shapes::Mixin"), 1) << "second base of a multiple inheritance";
  EXPECT_EQ(base->IsAKindOf("VLXBaseUnknown"), 1);
  EXPECT_EQ(base->IsAKindOf("VLXError"), 0);
  EXPECT_EQ(base->IsA(nullptr), 0);
  EXPECT_TRUE(base->GetMetaObject() == typeid(shapes::Derived));

  void* found = &found;
  EXPECT_EQ(base->QueryInterface(IID_VLXBaseUnknown, &found), VLX_S_OK);
  EXPECT_EQ(found, base);
  EXPECT_EQ(base->GetRefCount(), 2u) << "a successful query adds a reference";
  base->Release();
  VLXIID other = IID_VLXBaseUnknown;
  other.Data4[7] ^= 1;
  EXPECT_EQ(base->QueryInterface(other, &found), VLX_E_NOINTERFACE);
  EXPECT_EQ(found, nullptr);
  EXPECT_EQ(base->QueryInterface("VLXBaseUnknown", &found), VLX_S_OK);
  base->Release();
  EXPECT_EQ(base->QueryInterface("(anonymous namespace)::shapes::Derived", &found), VLX_S_OK);
  base->Release();
  EXPECT_EQ(base->QueryInterface("Unknown", &found), VLX_E_NOINTERFACE);
  EXPECT_EQ(base->QueryInterface("VLXBaseUnknown", nullptr), VLX_E_INVALIDARG);
  EXPECT_EQ(base->GetRefCount(), 1u);

  unsigned int count = 7;
  EXPECT_EQ(base->GetTypeInfoCount(&count), VLX_S_OK);
  EXPECT_EQ(count, 0u);
  void* info = &info;
  EXPECT_EQ(base->GetTypeInfo(0, 0, &info), VLX_E_NOTIMPL);
  EXPECT_EQ(info, nullptr);
  EXPECT_EQ(base->Invoke(0, IID_VLXBaseUnknown, 0, 0, nullptr, nullptr, nullptr, nullptr), VLX_E_NOTIMPL);
  EXPECT_EQ(base->IsNull(), 0);
  EXPECT_EQ(base->IsEqual(base), 1);
  shapes::Counted stranger;
  EXPECT_EQ(base->IsEqual(&stranger), 0);
  EXPECT_EQ(base->ChangeComponentState(3), VLX_S_OK);
  EXPECT_EQ(base->GetComponentState(), 3);
  base->Release();
  EXPECT_EQ(g_destroyed, 1);
}

// ---- errors ----

class ErrorRegistry : public ::testing::Test
{
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

  static VLXUnicodeString Text(const VLXError& e) { return e.GetMessageText(); }
};

TEST_F(ErrorRegistry, MessageTextFillsParametersFromTheCatalog)
{
  VLXError e("T_1", "TestCatalog");
  const VLXUnicodeString params[] = {"model.xml", "reading"};
  e.SetNLSRequestParams(2, params);
  EXPECT_STREQ(e.GetId(), "T_1");
  EXPECT_STREQ(e.GetCatalog(), "TestCatalog");
  ASSERT_EQ(e.GetNLSParameterCount(), 2);
  EXPECT_STREQ(e.GetNLSParameter(2).c_str(), "reading");
  EXPECT_STREQ(Text(e).c_str(), "cannot open model.xml for reading");

  VLXError plain("T_2", "TestCatalog");
  EXPECT_STREQ(Text(plain).c_str(), "no parameters here, only a path /proc and /p");

  VLXError many("T_3", "TestCatalog");
  VLXUnicodeString ten[10];
  for (int i = 0; i < 10; ++i)
    ten[i] = ("p" + std::to_string(i + 1)).c_str();
  ten[2] = VLXUnicodeString("with\0nul", 8);
  many.SetNLSRequestParams(2, ten);
  EXPECT_STREQ(Text(many).c_str(), "ten: , one: p1, missing: []");
  many.SetNLSRequestParams(10, ten);
  const VLXUnicodeString full = Text(many);
  EXPECT_EQ(std::string(full.c_str(), static_cast<size_t>(full.GetLengthInByte())),
            std::string("ten: p10, one: p1, missing: [with\0nul]", 38));
}

TEST_F(ErrorRegistry, UnknownIdsStillGiveAReadableText)
{
  VLXError e("X_9", "NoSuchCatalog");
  const VLXUnicodeString params[] = {"a", "b"};
  e.SetNLSRequestParams(2, params);
  EXPECT_STREQ(Text(e).c_str(), "NoSuchCatalog:X_9 (a, b)");
  VLXError bare("T_404", "TestCatalog");
  EXPECT_STREQ(Text(bare).c_str(), "TestCatalog:T_404");
  VLXError nulls(nullptr, nullptr);
  EXPECT_STREQ(nulls.GetId(), "");
}

TEST_F(ErrorRegistry, ParameterOutOfRangeIsReported)
{
  FatalRecorder recorder;
  VLXError e("T_1", "TestCatalog");
  EXPECT_STREQ(e.GetNLSParameter(1).c_str(), "");
  EXPECT_EQ(FatalRecorder::Reports().size(), 1u);
  e.SetNLSRequestParams(3, nullptr);
  EXPECT_EQ(e.GetNLSParameterCount(), 0);
}

TEST_F(ErrorRegistry, GetReturnKinds)
{
  EXPECT_EQ(VLXError::GetReturn(1, nullptr, nullptr, __FILE__, __LINE__), VLX_S_OK);
  EXPECT_EQ(VLXError::VLXGetLastError(0, nullptr), nullptr);
  EXPECT_EQ(VLXError::GetReturn(2, nullptr, nullptr, __FILE__, __LINE__), VLX_E_FAIL);
  EXPECT_EQ(VLXError::VLXGetLastError(0, nullptr), nullptr) << "a null error records nothing";
  CountedError* e = new CountedError("T_1", "TestCatalog");
  EXPECT_EQ(VLXError::GetReturn(7, e, nullptr, "f", 1), VLX_E_INVALIDARG);
  EXPECT_EQ(VLXError::VLXGetLastError(0, nullptr), nullptr);
  EXPECT_EQ(VLXError::GetReturn(1, e, nullptr, "f", 1), VLX_S_OK);
  EXPECT_EQ(e->GetRefCount(), 1u) << "kind 1 leaves the caller's reference alone";
  EXPECT_EQ(VLXError::GetReturn(2, e, nullptr, "here.cpp", 42), VLX_E_FAIL);
  EXPECT_STREQ(e->GetSourceFile(), "here.cpp");
  EXPECT_EQ(e->GetSourceLine(), 42);
  EXPECT_EQ(e->GetRefCount(), 1u) << "the registry took over the caller's reference";
}

TEST_F(ErrorRegistry, GetCleanReRaiseKeepsTheCountsRight)
{
  CountedError* first = new CountedError("T_1", "TestCatalog");
  VLXError::GetReturn(2, first, nullptr, __FILE__, __LINE__);

  VLXError* got = VLXError::VLXGetLastError(0, nullptr);
  ASSERT_EQ(got, first);
  EXPECT_EQ(first->GetRefCount(), 2u);
  VLXError::VLXCleanLastError();
  EXPECT_EQ(first->GetRefCount(), 1u);
  EXPECT_EQ(VLXError::VLXGetLastError(0, nullptr), nullptr);
  EXPECT_EQ(VLXError::GetReturn(2, got, nullptr, __FILE__, __LINE__), VLX_E_FAIL); // re-raise
  EXPECT_EQ(first->GetRefCount(), 1u);
  EXPECT_EQ(g_destroyed, 0);

  // Re-raising the current last error without a clean leaves one reference too.
  VLXError* again = VLXError::VLXGetLastError(0, nullptr);
  VLXError::GetReturn(2, again, nullptr, __FILE__, __LINE__);
  EXPECT_EQ(first->GetRefCount(), 1u);
  EXPECT_EQ(g_destroyed, 0);

  // A new error replaces and releases the previous one.
  VLXError::GetReturn(2, new CountedError("T_2", "TestCatalog"), nullptr, __FILE__, __LINE__);
  EXPECT_EQ(g_destroyed, 1);
  VLXError::VLXCleanLastError();
  EXPECT_EQ(g_destroyed, 2);
  VLXError::VLXCleanLastError(); // nothing left: harmless
}

TEST_F(ErrorRegistry, LastErrorIsPerThreadAndReleasedAtThreadExit)
{
  std::mutex m;
  std::condition_variable cv;
  int recorded = 0;
  std::atomic<int> mismatches{0};
  auto worker = [&](const char* id) {
    VLXError::GetReturn(2, new CountedError(id, "TestCatalog"), nullptr, __FILE__, __LINE__);
    {
      std::unique_lock<std::mutex> lock(m);
      ++recorded;
      cv.notify_all();
      cv.wait(lock, [&] { return recorded == 2; }); // both have recorded before either reads
    }
    VLXError* mine = VLXError::VLXGetLastError(0, nullptr);
    if (mine == nullptr || std::strcmp(mine->GetId(), id) != 0)
      ++mismatches;
    if (mine != nullptr)
      mine->Release();
  };
  std::thread a(worker, "T_1"), b(worker, "T_2");
  a.join();
  b.join();
  EXPECT_EQ(mismatches, 0);
  EXPECT_EQ(g_destroyed, 2) << "each thread's last error is released when it exits";
  EXPECT_EQ(VLXError::VLXGetLastError(0, nullptr), nullptr) << "the main thread saw neither";
}

// ---- fatal errors ----

TEST(FatalError, RecordingHandlerSeesMessageDetailsFileAndLine)
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

void Other(const char*, const char*, int) {}

TEST(FatalError, SetHandlerReturnsThePreviousOneAndNullRestoresTheDefault)
{
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
  mutex.Lock();
  mutex.Lock();
  EXPECT_EQ(mutex.TryLock(), 1);
  auto otherCanTake = [&mutex] {
    int got = 0;
    std::thread t([&] {
      got = mutex.TryLock();
      if (got)
        mutex.Unlock();
    });
    t.join();
    return got;
  };
  EXPECT_EQ(otherCanTake(), 0);
  mutex.Unlock();
  mutex.Unlock();
  EXPECT_EQ(otherCanTake(), 0) << "still held once";
  mutex.Unlock();
  EXPECT_EQ(otherCanTake(), 1);
}

TEST(Mutex, SerialisesConcurrentUpdates)
{
  VLXMutex mutex(0, 0, 0);
  long counter = 0;
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t)
    threads.emplace_back([&] {
      for (int i = 0; i < 50000; ++i) {
        mutex.Lock();
        mutex.Lock();
        ++counter;
        mutex.Unlock();
        mutex.Unlock();
      }
    });
  for (std::thread& t : threads)
    t.join();
  EXPECT_EQ(counter, 200000);
}

TEST(Mutex, UnlockByAThreadThatDoesNotHoldItIsReported)
{
  FatalRecorder recorder; // the recorder is per thread: record on the main thread
  VLXMutex mutex(0, 0, 0);
  mutex.Unlock();
  EXPECT_EQ(FatalRecorder::Reports().size(), 1u);
}

} // namespace
