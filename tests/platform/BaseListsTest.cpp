// Value lists (one typed suite over every list type) and the pointer list VLXRawCollPV.
#include "FatalRecorder.h"
#include "VLXBinary.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXBoolean.h"
#include "VLXListValVLXTime.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXRawCollPV.h"
#include "VLXRawColldouble.h"
#include "VLXRawCollint.h"

#include <gtest/gtest.h>

#include <string>

namespace {

// Distinct values of each element type.
template <class T>
T Value(int k);
template <>
VLXUnicodeString Value(int k)
{
  return VLXUnicodeString(("v" + std::to_string(k)).c_str());
}
template <>
VLXBoolean Value(int k)
{
  return static_cast<VLXBoolean>(k + 1);
}
template <>
int Value(int k)
{
  return k * 7 - 3;
}
template <>
double Value(int k)
{
  return k * 0.5 - 1.25;
}
template <>
VLXTime Value(int k)
{
  VLXTime t;
  t.Settime_t(1000000 + k);
  return t;
}
template <>
VLXBinary Value(int k)
{
  const unsigned char bytes[3] = {static_cast<unsigned char>(k), 0, static_cast<unsigned char>(k + 1)};
  return VLXBinary(bytes, 3);
}

template <class List>
class ValueList : public ::testing::Test {
 protected:
  using T = typename List::ElementType;
  static List Make(std::initializer_list<int> keys)
  {
    List list;
    for (int k : keys) list.Append(Value<T>(k));
    return list;
  }
  static bool Holds(const List& list, std::initializer_list<int> keys) { return list == Make(keys); }
};

using ListTypes = ::testing::Types<VLXListValVLXUnicodeString, VLXListValVLXBoolean, VLXListValVLXTime,
                                   VLXListValVLXBinary, VLXRawCollint, VLXRawColldouble>;
TYPED_TEST_SUITE(ValueList, ListTypes);

TYPED_TEST(ValueList, PositionsCountFromOneInIndexLocateAndRemovePosition)
{
  using T = typename TypeParam::ElementType;
  TypeParam list = this->Make({1, 5, 2, 5});  // 5 at positions 2 and 4
  EXPECT_TRUE(list[1] == Value<T>(1));
  EXPECT_TRUE(list[4] == Value<T>(5));
  const struct {
    int key, from, found;
  } locate[] = {{5, 1, 2}, {5, 2, 2}, {5, 3, 4}, {5, 4, 4}, {5, 5, 0}, {99, 1, 0}, {1, 0, 1}, {1, -3, 1}, {1, 2, 0}};
  for (const auto& c : locate) EXPECT_EQ(list.Locate(Value<T>(c.key), c.from), c.found) << c.key << " from " << c.from;
  EXPECT_EQ(list.Locate(Value<T>(5)), 2) << "the default start is 1";
  EXPECT_EQ(TypeParam().Locate(Value<T>(1)), 0);

  list[2] = Value<T>(3);
  list.RemovePosition(1);
  EXPECT_TRUE(this->Holds(list, {3, 2, 5}));
  list.RemovePosition(3);
  EXPECT_TRUE(this->Holds(list, {3, 2}));
  list.RemovePosition(2);
  EXPECT_TRUE(this->Holds(list, {3}));
}

TYPED_TEST(ValueList, CopiesAreIndependentAndEqualityComparesInOrder)
{
  using T = typename TypeParam::ElementType;
  TypeParam a = this->Make({1, 2});
  TypeParam b(a), c;
  c = a;
  a[1] = Value<T>(9);
  a.Append(Value<T>(3));
  EXPECT_TRUE(this->Holds(b, {1, 2}));
  EXPECT_TRUE(this->Holds(c, {1, 2}));
  EXPECT_TRUE(this->Holds(a, {9, 2, 3}));
  c = c;
  EXPECT_TRUE(this->Holds(c, {1, 2}));
  EXPECT_TRUE(this->Make({1, 2}) != this->Make({2, 1}));
  EXPECT_TRUE(this->Make({1, 2}) != this->Make({1, 2, 3}));
  EXPECT_FALSE(this->Make({1}) != this->Make({1}));
  EXPECT_TRUE(TypeParam() == TypeParam());
}

TYPED_TEST(ValueList, EmptyListsHoldNoStorageAndRemoveAllChoosesWhetherToKeepIt)
{
  TypeParam empty, copy(empty), assigned = this->Make({1});
  assigned = empty;
  EXPECT_EQ(empty.Capacity() + copy.Capacity() + assigned.Size(), 0);
  TypeParam list = this->Make({1, 2, 3});
  list.RemoveAll(0);
  EXPECT_EQ(list.Size(), 0);
  EXPECT_GE(list.Capacity(), 3) << "RemoveAll(0) keeps the storage";
  list.Append(Value<typename TypeParam::ElementType>(4));
  list.RemoveAll(1);
  EXPECT_EQ(list.Capacity(), 0) << "RemoveAll(1) frees it";
  list.Append(Value<typename TypeParam::ElementType>(5));
  list.RemoveAll();
  EXPECT_EQ(list.Capacity(), 0) << "the default frees";
}

TYPED_TEST(ValueList, OutOfRangePositionsAreReportedAndHarmlessWhenTheHandlerReturns)
{
  using T = typename TypeParam::ElementType;
  FatalRecorder recorder;
  TypeParam list = this->Make({1, 2});
  list[0] = Value<T>(7);  // writing the scratch element must not touch the list
  (void)list[3];
  (void)static_cast<const TypeParam&>(list)[-1];
  list.RemovePosition(3);
  list.RemovePosition(0);
  ASSERT_EQ(FatalRecorder::Reports().size(), 5u);
  for (const FatalReport& r : FatalRecorder::Reports()) {
    EXPECT_EQ(r.message.rfind("AssertionFailed:", 0), 0u) << r.message;
    EXPECT_NE(r.file.find("VLXList.h"), std::string::npos) << r.file;
  }
  EXPECT_TRUE(this->Holds(list, {1, 2}));
}

// ---- VLXRawCollPV ----

struct Item {
  int key, serial;
};
int ByKey(Item* a, Item* b) { return a->key - b->key; }
int ByPointedInt(const void* a, const void* b) { return *static_cast<const int*>(a) - *static_cast<const int*>(b); }

TEST(RawCollPV, PositionsLocateSizeAndStorage)
{
  int a = 1, b = 2;
  VLXRawCollPV list;
  EXPECT_EQ(list.Capacity(), 0);
  list.Append(&a);
  list.Append(&b);
  list.Append(&a);
  EXPECT_EQ(list[2], &b);
  EXPECT_EQ(list.Locate(&a), 1);
  EXPECT_EQ(list.Locate(&a, 2), 3);
  EXPECT_EQ(list.Locate(&a, 4), 0);
  EXPECT_EQ(list.Locate(nullptr), 0);
  list[2] = nullptr;
  EXPECT_EQ(list.Locate(nullptr), 2);
  list.RemovePosition(1);
  ASSERT_EQ(list.Size(), 2);
  EXPECT_EQ(list[2], &a);
  list[1] = &b;
  list.Size(4);  // grows with nulls
  EXPECT_EQ(list[2], &a);
  EXPECT_EQ(list[3], nullptr);
  EXPECT_EQ(list[4], nullptr);
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
  static_cast<VLXRawCollPV*>(root)->Append(root);
  delete root;  // virtual destructor: no leak under the sanitizer
}

TEST(RawCollPV, SortsAreStableAndCompareOrdersElementwiseThenBySize)
{
  int values[] = {5, -2, 9, 0, 5, 3};
  VLXRawCollPV ints;
  for (int& v : values) ints.Append(&v);
  ints.QuickSort(&ByPointedInt);
  const int order[] = {1, 3, 5, 0, 4, 2};  // the two 5s keep their order
  for (int p = 1; p <= 6; ++p) EXPECT_EQ(ints[p], &values[order[p - 1]]) << p;

  Item items[] = {{3, 0}, {1, 1}, {3, 2}, {2, 3}};
  VLXRawCollPV list, prefix;
  for (Item& i : items) list.Append(&i);
  VLXRawCollPV copy(list);
  list.QuickSort(&ByKey);
  const int serials[] = {1, 3, 0, 2};
  for (int p = 1; p <= 4; ++p) EXPECT_EQ(static_cast<Item*>(list[p])->serial, serials[p - 1]) << p;
  EXPECT_EQ(static_cast<Item*>(copy[1])->serial, 0) << "the copy is a separate list";
  prefix.Append(list[1]);
  EXPECT_EQ(VLXRawCollPV::Compare(list, list, &ByKey), 0);
  EXPECT_GT(VLXRawCollPV::Compare(copy, list, &ByKey), 0) << "key 3 against key 1 at position 1";
  EXPECT_LT(VLXRawCollPV::Compare(prefix, list, &ByKey), 0) << "a prefix is smaller";
  EXPECT_GT(VLXRawCollPV::Compare(list, prefix, &ByKey), 0);
  EXPECT_LT(VLXRawCollPV::Compare(&values[0], &values[1]), 0) << "pointers compare by address";
  EXPECT_GT(VLXRawCollPV::Compare(&values[1], &values[0]), 0);
  EXPECT_LT(VLXRawCollPV::Compare(nullptr, &values[0]), 0);
}

}  // namespace
