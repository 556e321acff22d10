// Value lists (one typed suite over every list name) and the pointer list VLXRawCollPV.
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
#include <type_traits>

namespace
{

// Distinct values of each element type.
template <class T>
T Value(int k);
template <>
VLXUnicodeString Value<VLXUnicodeString>(int k)
{
  return VLXUnicodeString(("v" + std::to_string(k)).c_str());
}
template <>
VLXBoolean Value<VLXBoolean>(int k)
{
  return static_cast<VLXBoolean>(k + 1);
}
template <>
VLXTime Value<VLXTime>(int k)
{
  VLXTime t;
  t.Settime_t(1000000 + k);
  return t;
}
template <>
VLXBinary Value<VLXBinary>(int k)
{
  const unsigned char bytes[3] = {static_cast<unsigned char>(k), 0, static_cast<unsigned char>(k + 1)};
  return VLXBinary(bytes, 3);
}
template <>
int Value<int>(int k)
{
  return k * 7 - 3;
}
template <>
double Value<double>(int k)
{
  return k * 0.5 - 1.25;
}

template <class List>
class ValueList : public ::testing::Test
{
protected:
  using T = typename List::ElementType;
  static List Make(std::initializer_list<int> keys)
  {
    List list;
    for (int k : keys)
      list.Append(Value<T>(k));
    return list;
  }
};

using ListTypes = ::testing::Types<VLXListValVLXUnicodeString, VLXListValVLXBoolean, VLXListValVLXTime,
                                   VLXListValVLXBinary, VLXRawCollint, VLXRawColldouble>;
TYPED_TEST_SUITE(ValueList, ListTypes);

TYPED_TEST(ValueList, PositionsCountFromOne)
{
  using T = typename TypeParam::ElementType;
  TypeParam list = this->Make({10, 11, 12});
  ASSERT_EQ(list.Size(), 3);
  EXPECT_TRUE(list[1] == Value<T>(10));
  EXPECT_TRUE(list[3] == Value<T>(12));
  list[2] = Value<T>(20);
  const TypeParam& view = list;
  EXPECT_TRUE(view[2] == Value<T>(20));
}

TYPED_TEST(ValueList, LocateStartsAtTheGivenPosition)
{
  using T = typename TypeParam::ElementType;
  // x at positions 2 and 4.
  const TypeParam list = this->Make({1, 5, 2, 5});
  EXPECT_EQ(list.Locate(Value<T>(5)), 2);
  EXPECT_EQ(list.Locate(Value<T>(5), 1), 2);
  EXPECT_EQ(list.Locate(Value<T>(5), 2), 2);
  EXPECT_EQ(list.Locate(Value<T>(5), 3), 4);
  EXPECT_EQ(list.Locate(Value<T>(5), 5), 0);
  EXPECT_EQ(list.Locate(Value<T>(99)), 0);
  EXPECT_EQ(list.Locate(Value<T>(1), 0), 1) << "a start below 1 counts as 1";
  EXPECT_EQ(TypeParam().Locate(Value<T>(1)), 0);
}

TYPED_TEST(ValueList, RemovePositionMovesTheFollowingElementsUp)
{
  using T = typename TypeParam::ElementType;
  TypeParam list = this->Make({1, 2, 3, 4});
  list.RemovePosition(2);
  ASSERT_EQ(list.Size(), 3);
  EXPECT_TRUE(list[1] == Value<T>(1));
  EXPECT_TRUE(list[2] == Value<T>(3));
  EXPECT_TRUE(list[3] == Value<T>(4));
  list.RemovePosition(3);
  list.RemovePosition(1);
  ASSERT_EQ(list.Size(), 1);
  EXPECT_TRUE(list[1] == Value<T>(3));
}

TYPED_TEST(ValueList, EmptyListsHoldNoStorageAndRemoveAllChoosesWhetherToKeepIt)
{
  TypeParam empty;
  EXPECT_EQ(empty.Capacity(), 0);
  TypeParam copy(empty);
  EXPECT_EQ(copy.Capacity(), 0);
  TypeParam assigned = this->Make({1});
  assigned = empty;
  EXPECT_EQ(assigned.Size(), 0);

  TypeParam list = this->Make({1, 2, 3});
  list.RemoveAll(0);
  EXPECT_EQ(list.Size(), 0);
  EXPECT_GE(list.Capacity(), 3) << "RemoveAll(0) keeps the storage";
  list.Append(Value<typename TypeParam::ElementType>(4));
  list.RemoveAll(1);
  EXPECT_EQ(list.Size(), 0);
  EXPECT_EQ(list.Capacity(), 0) << "RemoveAll(1) frees it";
  list.Append(Value<typename TypeParam::ElementType>(5));
  list.RemoveAll();
  EXPECT_EQ(list.Capacity(), 0) << "the default frees";
}

TYPED_TEST(ValueList, CopiesAndAssignmentsAreIndependent)
{
  using T = typename TypeParam::ElementType;
  TypeParam a = this->Make({1, 2});
  TypeParam b(a);
  TypeParam c;
  c = a;
  a[1] = Value<T>(9);
  a.Append(Value<T>(3));
  EXPECT_EQ(b.Size(), 2);
  EXPECT_TRUE(b[1] == Value<T>(1));
  EXPECT_TRUE(c[1] == Value<T>(1));
  EXPECT_TRUE(b == c);
  EXPECT_TRUE(a != b);
  c = c;
  EXPECT_EQ(c.Size(), 2);
}

TYPED_TEST(ValueList, EqualityComparesSizesThenElementsInOrder)
{
  EXPECT_TRUE(this->Make({1, 2}) == this->Make({1, 2}));
  EXPECT_TRUE(this->Make({1, 2}) != this->Make({2, 1}));
  EXPECT_TRUE(this->Make({1, 2}) != this->Make({1, 2, 3}));
  EXPECT_TRUE(TypeParam() == TypeParam());
  EXPECT_FALSE(this->Make({1}) != this->Make({1}));
}

TYPED_TEST(ValueList, OutOfRangePositionsAreReportedAndHarmlessWhenTheHandlerReturns)
{
  using T = typename TypeParam::ElementType;
  FatalRecorder recorder;
  TypeParam list = this->Make({1, 2});
  T& bad = list[0];
  bad = Value<T>(7); // writing the scratch element must not touch the list
  (void)list[3];
  const TypeParam& view = list;
  (void)view[-1];
  list.RemovePosition(3);
  list.RemovePosition(0);
  ASSERT_EQ(FatalRecorder::Reports().size(), 5u);
  for (const FatalReport& r : FatalRecorder::Reports()) {
    EXPECT_NE(r.message.find("AssertionFailed:"), std::string::npos) << r.message;
    EXPECT_NE(r.file.find("VLXList.h"), std::string::npos) << r.file;
    EXPECT_GT(r.line, 0);
  }
  ASSERT_EQ(list.Size(), 2);
  EXPECT_TRUE(list[1] == Value<T>(1));
  EXPECT_TRUE(list[2] == Value<T>(2));
}

TEST(ValueListNames, TypedefsAndNamesAreTheSameTypesAndSizeHintsOnlyReserve)
{
  static_assert(std::is_same<VLXListOfVLXUnicodeString, VLXListValVLXUnicodeString>::value, "");
  static_assert(std::is_same<VLXListOfVLXBoolean, VLXListValVLXBoolean>::value, "");
  static_assert(std::is_same<VLXListOfVLXTime, VLXListValVLXTime>::value, "");
  static_assert(std::is_same<VLXListOfVLXBinary, VLXListValVLXBinary>::value, "");
  static_assert(std::is_same<VLXListOfInt, VLXRawCollint>::value, "");
  static_assert(std::is_same<VLXListOfDouble, VLXRawColldouble>::value, "");
  VLXRawCollint hinted(100);
  EXPECT_EQ(hinted.Size(), 0);
  EXPECT_GE(hinted.Capacity(), 100);
  VLXRawColldouble none(0);
  EXPECT_EQ(none.Capacity(), 0);
}

// ---- VLXRawCollPV ----

int ByPointedInt(const void* a, const void* b)
{
  const int x = *static_cast<const int*>(a), y = *static_cast<const int*>(b);
  return x < y ? -1 : (x > y ? 1 : 0);
}

struct Item
{
  int key;
  int serial;
};

int ByKey(Item* a, Item* b) { return a->key - b->key; }

TEST(RawCollPV, PositionsSizeAndLocate)
{
  int a = 1, b = 2;
  VLXRawCollPV list(4);
  EXPECT_EQ(list.Size(), 0);
  list.Append(&a);
  list.Append(&b);
  list.Append(&a);
  EXPECT_EQ(list[1], &a);
  EXPECT_EQ(list[2], &b);
  EXPECT_EQ(list.Locate(&a), 1);
  EXPECT_EQ(list.Locate(&a, 2), 3);
  EXPECT_EQ(list.Locate(&a, 4), 0);
  EXPECT_EQ(list.Locate(nullptr), 0);
  list[2] = nullptr;
  EXPECT_EQ(list.Locate(nullptr), 2);
  list.RemovePosition(1);
  EXPECT_EQ(list.Size(), 2);
  EXPECT_EQ(list[2], &a);
}

TEST(RawCollPV, SizeGrowsWithNullsAndShrinks)
{
  int a = 1;
  VLXRawCollPV list;
  list.Append(&a);
  list.Size(4);
  ASSERT_EQ(list.Size(), 4);
  EXPECT_EQ(list[1], &a);
  EXPECT_EQ(list[2], nullptr);
  EXPECT_EQ(list[4], nullptr);
  list.Size(1);
  EXPECT_EQ(list.Size(), 1);
  EXPECT_EQ(list[1], &a);
  FatalRecorder recorder;
  list.Size(-1);
  EXPECT_EQ(list.Size(), 1);
  EXPECT_EQ(FatalRecorder::Reports().size(), 1u);
}

TEST(RawCollPV, RemoveAllKeepsOrFreesTheStorage)
{
  int a = 1;
  VLXRawCollPV list;
  EXPECT_EQ(list.Capacity(), 0);
  for (int i = 0; i < 10; ++i)
    list.Append(&a);
  list.RemoveAll(VLXCollec::KeepMemory);
  EXPECT_EQ(list.Size(), 0);
  EXPECT_GE(list.Capacity(), 10);
  list.Append(&a);
  list.RemoveAll(VLXCollec::FreeMemory);
  EXPECT_EQ(list.Capacity(), 0);
}

TEST(RawCollPV, QuickSortGivesTheComparisonTheElementValues)
{
  int values[] = {5, -2, 9, 0, 5, 3};
  VLXRawCollPV list;
  for (int& v : values)
    list.Append(&v);
  list.QuickSort(&ByPointedInt);
  ASSERT_EQ(list.Size(), 6);
  for (int p = 2; p <= list.Size(); ++p)
    EXPECT_LE(*static_cast<int*>(list[p - 1]), *static_cast<int*>(list[p]));
  EXPECT_EQ(list[1], &values[1]);
  // The two 5s keep their relative order.
  EXPECT_EQ(list[4], &values[0]);
  EXPECT_EQ(list[5], &values[4]);
}

TEST(RawCollPV, TypedSortAndListComparison)
{
  Item items[] = {{3, 0}, {1, 1}, {3, 2}, {2, 3}};
  VLXRawCollPV list;
  for (Item& i : items)
    list.Append(&i);
  VLXRawCollPV copy(list);
  list.QuickSort(&ByKey);
  EXPECT_EQ(static_cast<Item*>(list[1])->serial, 1);
  EXPECT_EQ(static_cast<Item*>(list[2])->serial, 3);
  EXPECT_EQ(static_cast<Item*>(list[3])->serial, 0);
  EXPECT_EQ(static_cast<Item*>(list[4])->serial, 2);
  EXPECT_EQ(static_cast<Item*>(copy[1])->serial, 0) << "the copy is a separate list";

  EXPECT_EQ(VLXRawCollPV::Compare(list, list, &ByKey), 0);
  EXPECT_GT(VLXRawCollPV::Compare(copy, list, &ByKey), 0) << "key 3 against key 1 at position 1";
  VLXRawCollPV prefix;
  prefix.Append(list[1]);
  EXPECT_LT(VLXRawCollPV::Compare(prefix, list, &ByKey), 0) << "a prefix is smaller";
  EXPECT_GT(VLXRawCollPV::Compare(list, prefix, &ByKey), 0);
  EXPECT_EQ(VLXRawCollPV::Compare(list, list, nullptr), 0);
}

TEST(RawCollPV, PointerCompareOrdersByAddress)
{
  int pair[2] = {0, 0};
  EXPECT_LT(VLXRawCollPV::Compare(&pair[0], &pair[1]), 0);
  EXPECT_GT(VLXRawCollPV::Compare(&pair[1], &pair[0]), 0);
  EXPECT_EQ(VLXRawCollPV::Compare(&pair[1], &pair[1]), 0);
  EXPECT_LT(VLXRawCollPV::Compare(nullptr, &pair[0]), 0);
}

TEST(RawCollPV, OutOfRangeIndexIsReportedAndDoesNotTouchTheList)
{
  FatalRecorder recorder;
  int a = 1;
  VLXRawCollPV list;
  list.Append(&a);
  list[2] = &a;
  list.RemovePosition(5);
  EXPECT_EQ(FatalRecorder::Reports().size(), 2u);
  EXPECT_EQ(list.Size(), 1);
  const VLXRawCollPV& view = list;
  EXPECT_EQ(view[0], nullptr);
}

TEST(RawCollPV, DestroysThroughTheCollectionBase)
{
  VLXCollecRoot* root = new VLXRawCollPV(8);
  static_cast<VLXRawCollPV*>(root)->Append(root);
  delete root; // virtual destructor: no leak under the sanitizer
}

} // namespace
