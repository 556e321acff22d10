// The base layer: strings, value lists, the pointer list, result codes, the
// base object, errors and the per-thread last error, the fatal-error hook and
// the recursive mutex.
#include "FatalRecorder.h"
#include "VLXBaseUnknown.h"
#include "VLXBinary.h"
#include "VLXError.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXBoolean.h"
#include "VLXListValVLXTime.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXMutex.h"
#include "VLXRawCollPV.h"
#include "VLXRawColldouble.h"
#include "VLXRawCollint.h"
#include "VLXResult.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <new>
#include <string>
#include <thread>
#include <typeinfo>
#include <vector>

namespace {
using namespace std::string_literals;

std::string Str(const VLXUnicodeString& s) { return std::string(s.c_str(), size_t(s.GetLengthInByte())); }

TEST(UnicodeString, HoldsExactlyItsBytesAndAssignsFromItsOwn)
{
  for (const VLXUnicodeString& s : {VLXUnicodeString(static_cast<const char*>(nullptr)), VLXUnicodeString(nullptr, 5),
                                    VLXUnicodeString("abc", 0), VLXUnicodeString("abc", -1)})
    EXPECT_EQ(s.GetLengthInByte(), 0);
  const VLXUnicodeString a("a\0b", 3);
  EXPECT_EQ(std::memcmp(a.c_str(), "a\0b\0", 4), 0) << "bytes followed by one NUL";
  EXPECT_TRUE(a == VLXUnicodeString("a\0b", 3) && a != VLXUnicodeString("a\0c", 3) && a != VLXUnicodeString("a"));
  VLXUnicodeString s("h\xC3\xA9llo");
  s = s.c_str() + 1;
  EXPECT_EQ(Str(s), "\xC3\xA9llo");
  s = static_cast<const char*>(nullptr);
  EXPECT_STREQ(s.c_str(), "");
}

TEST(UnicodeString, FirstMalformedOffsetNamesTheFirstIllFormedSequenceAndWhy)
{
  const struct {
    std::string bytes;
    int offset;  // -1: well-formed
    const char* reason;
  } cases[] = {{"a\0b\xC2\x80\xDF\xBF\xE0\xA0\x80\xE2\x82\xAC\xEF\xBF\xBF\xED\x9F\xBF\xEE\x80\x80"s, -1, ""},
               {"\xF0\x90\x80\x80\xF0\x9F\x98\x80\xF4\x8F\xBF\xBF", -1, ""},
               {"", -1, ""},
               {"ab\xC0\x80", 2, "overlong"},
               {"\xC1\xBF", 0, "overlong"},
               {"x\xE0\x9F\xBF", 1, "overlong"},
               {"\xF0\x8F\xBF\xBF", 0, "overlong"},
               {"\xED\xA0\x80", 0, "surrogate"},
               {"ok\xED\xBF\xBF", 2, "surrogate"},
               {"\xF4\x90\x80\x80", 0, "above U+10FFFF"},
               {"\xF5\x80\x80\x80", 0, "above U+10FFFF"},
               {"abc\xE2\x82", 3, "truncated"},
               {"\xF0\x9F\x98", 0, "truncated"},
               {"\xC3", 0, "truncated"},
               {"\xE2\x28\xA1", 0, "truncated"},
               {"\xC3\0"s, 0, "truncated"},
               {"a\x80", 1, "continuation"},
               {"\xC3\xA9\xA9", 2, "continuation"},
               {"\xC3\xA9\x80\xFF", 2, "continuation"},
               {"abc\xFF", 3, "never occurs"},
               {"\xF8\x88\x80\x80\x80", 0, "never occurs"}};
  for (const auto& c : cases) {
    SCOPED_TRACE(::testing::PrintToString(c.bytes));
    const VLXUnicodeString s(c.bytes.data(), static_cast<int>(c.bytes.size()));
    const char* reason = "unset";
    EXPECT_EQ(s.FirstMalformedOffset(&reason), c.offset);
    EXPECT_EQ(s.IsWellFormed(), c.offset < 0 ? 1 : 0);
    if (c.offset < 0)
      EXPECT_EQ(reason, nullptr);
    else
      EXPECT_NE(std::string(reason ? reason : "").find(c.reason), std::string::npos) << reason;
  }
}

// Distinct values of each element type.
void Make(int k, VLXUnicodeString& v) { v = ("v" + std::to_string(k)).c_str(); }
void Make(int k, VLXBoolean& v) { v = static_cast<VLXBoolean>(k + 1); }
void Make(int k, int& v) { v = k * 7 - 3; }
void Make(int k, double& v) { v = k * 0.5 - 1.25; }
void Make(int k, VLXTime& v) { v.Settime_t(1000000 + k); }
void Make(int k, VLXBinary& v) { v = VLXBinary(std::string{char(k), 0, char(k + 1)}.data(), 3); }
template <class T>
T Value(int k, T v = T())
{
  return Make(k, v), v;
}

template <class List>
class ValueList : public ::testing::Test {
 protected:
  using T = typename List::ElementType;
  static List Of(std::initializer_list<int> keys)
  {
    List list;
    for (int k : keys) list.Append(Value<T>(k));
    return list;
  }
};
using ListTypes = ::testing::Types<VLXListValVLXUnicodeString, VLXListValVLXBoolean, VLXListValVLXTime,
                                   VLXListValVLXBinary, VLXRawCollint, VLXRawColldouble>;
TYPED_TEST_SUITE(ValueList, ListTypes);

TYPED_TEST(ValueList, PositionsCountFromOneInIndexLocateAndRemovePosition)
{
  using T = typename TypeParam::ElementType;
  TypeParam list = this->Of({1, 5, 2, 5});
  EXPECT_TRUE(list[1] == Value<T>(1) && list[4] == Value<T>(5));
  const int locate[][3] = {{5, 1, 2},  {5, 2, 2}, {5, 3, 4},  {5, 4, 4}, {5, 5, 0},
                           {99, 1, 0}, {1, 0, 1}, {1, -3, 1}, {1, 2, 0}};  // key, from, found
  for (const auto& c : locate) EXPECT_EQ(list.Locate(Value<T>(c[0]), c[1]), c[2]) << c[0] << " from " << c[1];
  EXPECT_EQ(list.Locate(Value<T>(5)), 2) << "the default start is 1";
  EXPECT_EQ(TypeParam().Locate(Value<T>(1)), 0);
  list[2] = Value<T>(3);
  list.RemovePosition(1);
  EXPECT_TRUE(list == this->Of({3, 2, 5}));
  list.RemovePosition(3);
  list.RemovePosition(2);
  EXPECT_TRUE(list == this->Of({3}));
}

TYPED_TEST(ValueList, CopiesAreIndependentEqualityIsInOrderAndEmptyListsHoldNoStorage)
{
  TypeParam a = this->Of({1, 2}), b(a), c;
  c = a;
  a[1] = Value<typename TypeParam::ElementType>(9);
  a.Append(Value<typename TypeParam::ElementType>(3));
  c = c;
  EXPECT_TRUE(b == this->Of({1, 2}) && c == this->Of({1, 2}) && a == this->Of({9, 2, 3}));
  EXPECT_TRUE(this->Of({1, 2}) != this->Of({2, 1}) && this->Of({1, 2}) != this->Of({1, 2, 3}));
  EXPECT_FALSE(this->Of({1}) != this->Of({1}));

  TypeParam empty, copy(empty), assigned = this->Of({1});
  assigned = empty;
  EXPECT_EQ(empty.Capacity() + copy.Capacity() + assigned.Size(), 0);
  a.RemoveAll(0);
  EXPECT_EQ(a.Size(), 0);
  EXPECT_GE(a.Capacity(), 3) << "RemoveAll(0) keeps the storage";
  b.RemoveAll(1);
  c.RemoveAll();
  EXPECT_EQ(b.Capacity() + c.Capacity(), 0) << "RemoveAll(1) and the default free it";
}

TYPED_TEST(ValueList, OutOfRangePositionsAreReportedAndHarmlessWhenTheHandlerReturns)
{
  FatalRecorder recorder;
  TypeParam list = this->Of({1, 2});
  list[0] = Value<typename TypeParam::ElementType>(7);  // writes the scratch element, not the list
  (void)list[3];
  (void)static_cast<const TypeParam&>(list)[-1];
  list.RemovePosition(3);
  list.RemovePosition(0);
  ASSERT_EQ(FatalRecorder::Reports().size(), 5u);
  for (const FatalReport& r : FatalRecorder::Reports()) {
    EXPECT_EQ(r.message.rfind("AssertionFailed:", 0), 0u) << r.message;
    EXPECT_NE(r.file.find("VLXList.h"), std::string::npos) << r.file;
  }
  EXPECT_TRUE(list == this->Of({1, 2}));
}

int ByPointedInt(const void* a, const void* b) { return *static_cast<const int*>(a) - *static_cast<const int*>(b); }

TEST(RawCollPV, PositionsLocateSizeStorageAndOutOfRangeReports)
{
  int a = 1, b = 2;
  VLXRawCollPV list;
  EXPECT_EQ(list.Capacity(), 0);
  for (int* p : {&a, &b, &a}) list.Append(p);
  EXPECT_EQ(list[2], &b);
  EXPECT_EQ(list.Locate(&a), 1);
  EXPECT_EQ(list.Locate(&a, 2), 3);
  EXPECT_EQ(list.Locate(&a, 4), 0);
  EXPECT_EQ(list.Locate(nullptr), 0);
  list[2] = nullptr;
  EXPECT_EQ(list.Locate(nullptr), 2);
  list.RemovePosition(1);
  list[1] = &b;
  list.Size(4);  // grows with nulls
  ASSERT_EQ(list.Size(), 4);
  EXPECT_TRUE(list[1] == &b && list[2] == &a && list[3] == nullptr && list[4] == nullptr);
  list.Size(1);
  ASSERT_EQ(list.Size(), 1);
  EXPECT_EQ(list[1], &b);
  list.RemoveAll(VLXCollec::KeepMemory);
  EXPECT_GE(list.Capacity(), 4);
  list.RemoveAll(VLXCollec::FreeMemory);
  EXPECT_EQ(list.Capacity(), 0);

  FatalRecorder recorder;
  list.Append(&a);
  list[2] = &b;
  list.RemovePosition(5);
  list.Size(-1);
  EXPECT_EQ(FatalRecorder::Reports().size(), 3u);
  ASSERT_EQ(list.Size(), 1);
  EXPECT_EQ(list[1], &a);
  EXPECT_EQ(static_cast<const VLXRawCollPV&>(list)[0], nullptr);
  VLXCollecRoot* root = new VLXRawCollPV(8);
  delete root;  // virtual destructor: no leak under the sanitizer
  // Sorts are stable; without a comparison pointers compare by address. (Comparing lists:
  // values/InstanceListTest, through the instance list built on this one.)
  int values[] = {5, -2, 9, 5};
  VLXRawCollPV ints;
  for (int& v : values) ints.Append(&v);
  VLXRawCollPV copy(ints);
  ints.QuickSort(&ByPointedInt);
  EXPECT_TRUE(ints[1] == &values[1] && ints[2] == &values[0] && ints[3] == &values[3] && ints[4] == &values[2]);
  copy.RemovePosition(2);
  copy.Append(&values[1]);
  copy.QuickSort(nullptr);
  EXPECT_TRUE(copy[1] == &values[0] && copy[2] == &values[1] && copy[4] == &values[3]) << "a separate list";
  EXPECT_LT(VLXRawCollPV::Compare(nullptr, &values[0]), 0);
}

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

TEST(BaseUnknown, TheLastReleaseDeletesEvenUnderConcurrentAddRefAndRelease)
{
  g_destroyed = 0;
  shapes::Counted* object = new shapes::Counted;
  EXPECT_EQ(object->GetRefCount(), 1u);
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t)
    threads.emplace_back([object] {
      for (int i = 0; i < 100000; ++i) object->AddRef(), object->Release();
    });
  for (std::thread& t : threads) t.join();
  EXPECT_EQ(object->AddRef(), 2u);
  EXPECT_EQ(object->Release(), 1u);
  EXPECT_EQ(g_destroyed, 0);
  EXPECT_EQ(object->Release(), 0u);
  EXPECT_EQ(g_destroyed, 1);

  shapes::Counted original, assigned;  // copies have a count of their own
  original.AddRef();
  shapes::Counted copy(original);
  assigned = original;
  EXPECT_EQ(copy.GetRefCount() + assigned.GetRefCount(), 2u);
}

TEST(BaseUnknown, ReleaseFreesOnlyWhatNewMade)
{
  g_destroyed = 0;
  struct Holder {
    shapes::Counted inside;
  };
  {
    shapes::Counted onStack;
    auto* held = new Holder;  // the standard new: a member is never freed by Release
    shapes::Counted* made = new shapes::Counted;
    shapes::Counted copy(*made);
    void* same = nullptr;
    for (VLXBaseUnknown* object : {static_cast<VLXBaseUnknown*>(&onStack), static_cast<VLXBaseUnknown*>(&copy),
                                   static_cast<VLXBaseUnknown*>(&held->inside)}) {
      EXPECT_EQ(VLX_S_OK, object->QueryInterface(IID_VLXBaseUnknown, &same));
      EXPECT_EQ(1u, object->Release());
      EXPECT_EQ(0u, object->Release());
    }
    EXPECT_EQ(0, g_destroyed);
    EXPECT_EQ(0u, made->Release());
    EXPECT_EQ(1, g_destroyed);
    delete held;
  }
  EXPECT_EQ(4, g_destroyed);
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

// No scripting type information, identity as equality, stored state, and the
// nothrow class allocator.
TEST(BaseUnknown, TypeInformationIsAbsentAndStoredStateIsKept)
{
  shapes::Counted object, other;
  unsigned int count = 7;
  void* info = &info;
  VLXIID iid = IID_VLXBaseUnknown;
  EXPECT_TRUE(object.GetTypeInfoCount(&count) == VLX_S_OK && count == 0u);
  EXPECT_EQ(object.GetTypeInfoCount(nullptr), VLX_E_INVALIDARG);
  EXPECT_TRUE(object.GetTypeInfo(0, 0, &info) == VLX_E_NOTIMPL && info == nullptr);
  EXPECT_EQ(object.GetIDsOfNames(iid, nullptr, 0, 0, nullptr), VLX_E_NOTIMPL);
  EXPECT_EQ(object.Invoke(0, iid, 0, 0, nullptr, nullptr, nullptr, nullptr), VLX_E_NOTIMPL);
  object.SetImpl(&count);
  EXPECT_EQ(object.ChangeComponentState(3), VLX_S_OK);
  EXPECT_TRUE(object.GetImpl() == &count && object.GetComponentState() == 3 && !object.IsNull());
  EXPECT_TRUE(object.IsEqual(&object) && !object.IsEqual(&other));
  EXPECT_EQ(object.GetMetaObject(), typeid(shapes::Counted));
  VLXBaseUnknown* made = new (std::nothrow) shapes::Counted;
  ASSERT_NE(made, nullptr);
  made->Release();
}

class ErrorRegistry : public ::testing::Test {
 protected:
  void SetUp() override
  {
    VLXError::VLXCleanLastError();
    g_destroyed = 0;
    static const VLXMessageEntry entries[] = {{"T_1", "cannot open /p1 for /p2"},
                                              {"T_2", "no parameters here, only a path /proc and /p"},
                                              {"T_3", "ten: /p10, one: /p1, missing: [/p3]"}};
    VLXError::RegisterCatalog("TestCatalog", entries, 3);
  }
  void TearDown() override { VLXError::VLXCleanLastError(); }
};

TEST_F(ErrorRegistry, MessageTextsFillTheParametersIntoTheCatalogText)
{
  VLXUnicodeString params[10];
  for (int i = 0; i < 10; ++i) params[i] = ("p" + std::to_string(i + 1)).c_str();
  params[2] = VLXUnicodeString("with\0nul", 8);
  const struct {
    const char *id, *catalog;
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
    EXPECT_EQ(Str(e.GetMessageText()), c.text) << c.id << " with " << c.count;
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
  VLXError::GetReturn(2, got, nullptr, __FILE__,
                      __LINE__);                                                               // re-raise after a clean
  VLXError::GetReturn(2, VLXError::VLXGetLastError(0, nullptr), nullptr, __FILE__, __LINE__);  // and again
  EXPECT_EQ(e->GetRefCount(), 1u);
  EXPECT_EQ(g_destroyed, 0);
  VLXError::GetReturn(2, new CountedError("T_2", "TestCatalog"), nullptr, __FILE__, __LINE__);
  EXPECT_EQ(g_destroyed, 1) << "a new error replaces and releases the previous one";
  VLXError::VLXCleanLastError();
  VLXError::VLXCleanLastError();  // nothing left: harmless
  EXPECT_EQ(g_destroyed, 2);
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
    VLXError* own = VLXError::VLXGetLastError(0, nullptr);
    sawOwn = own->GetId();
    own->Release();
  }).join();
  EXPECT_EQ(sawBefore, nullptr) << "another thread's error is not this one's";
  EXPECT_EQ(sawOwn, "T_2");
  EXPECT_EQ(g_destroyed, 1) << "the thread's last error was released when it exited";
  VLXError* still = VLXError::VLXGetLastError(0, nullptr);
  EXPECT_EQ(still, mine) << "the other thread did not replace this one's";
  if (still != nullptr) still->Release();
}

void Other(const char*, const char*, int) {}

TEST(FatalError, HandlersSeeMessageDetailsFileAndLineAndNullRestoresTheDefault)
{
  {
    FatalRecorder recorder;
    VLXFatalError("AssertionFailed: x > 0", nullptr, nullptr, nullptr, "Tessara\\src\\Unit", 120);
    VLXFatalError("AssertionFailed: y", "first", nullptr, "third", nullptr, 7);
    ASSERT_EQ(FatalRecorder::Reports().size(), 2u);
    const FatalReport& r = FatalRecorder::Reports()[0];
    EXPECT_TRUE(r.message == "AssertionFailed: x > 0" && r.file == "Tessara\\src\\Unit" && r.line == 120);
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
