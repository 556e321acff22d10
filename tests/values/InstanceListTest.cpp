// The list of instance proxies: construction, equality by Java identity, search, de-duplication,
// resizing, the two Array forms, sorting, and the global references its elements hold.
#include "TestSupport.h"

using namespace corvexa_test;

namespace {

std::vector<VLXKDMInstance>* gOrder = nullptr;

class InstanceList : public ::testing::Test {
 protected:
  // Five distinct Java instances, A to E.
  std::vector<VLXKDMInstance> o = NewInstances(5);
  const VLXKDMInstance &A = o[0], &B = o[1], &C = o[2], &D = o[3], &E = o[4];
  const long baseline = GlobalRefCount();

  // Proxies of their own (not the ones above) for the objects listed.
  VLXListValVLXKDMInstance Of(std::initializer_list<const VLXKDMInstance*> items)
  {
    VLXListValVLXKDMInstance list;
    for (const VLXKDMInstance* item : items) list.Append(VLXKDMInstance(*item));
    return list;
  }
  // The letter of each element ('-' for one without Java object, '?' for an unknown one).
  std::string Letters(const VLXListValVLXKDMInstance& list)
  {
    std::string out;
    for (int p = 1; p <= list.Size(); ++p) {
      char letter = list[p].GetHandle() ? '?' : '-';
      for (size_t k = 0; k < o.size(); ++k)
        if (list[p].GetHandle() && list[p] == o[k]) letter = static_cast<char>('A' + k);
      out += letter;
    }
    return out;
  }
  // Every test's lists are gone by its end: their references are given back.
  void TearDown() override { EXPECT_EQ(baseline, GlobalRefCount()); }
};

TEST_F(InstanceList, ConstructorsCopySkippingNullPointersAndEqualityIsJavaIdentity)
{
  VLXKDMInstance* pointers[] = {&o[0], nullptr, &o[2]};
  EXPECT_EQ("AC", Letters(VLXListValVLXKDMInstance(pointers, 3)));
  EXPECT_EQ("ABC", Letters(VLXListValVLXKDMInstance(o.data(), 3)));
  EXPECT_EQ("", Letters(VLXListValVLXKDMInstance(o.data(), 0)));
  EXPECT_EQ("", Letters(VLXListValVLXKDMInstance(pointers, -1)));
  EXPECT_EQ(0, VLXListValVLXKDMInstance(10, 99).Size());
  EXPECT_NE(VLXListValVLXKDMInstance(pointers, 3)[1].GetHandle(), o[0].GetHandle());  // a reference of its own

  const VLXListValVLXKDMInstance abc = Of({&A, &B, &C});
  EXPECT_TRUE(abc == Of({&A, &B, &C}) && !(abc != Of({&A, &B, &C})) && abc == abc);
  EXPECT_TRUE(abc != Of({&A, &C, &B}) && abc != Of({&A, &B}));
  EXPECT_TRUE(VLXListValVLXKDMInstance() == VLXListValVLXKDMInstance());
  VLXListValVLXKDMInstance unattached;
  unattached.Append(VLXKDMInstance());
  EXPECT_TRUE(unattached != Of({&A}) && unattached == VLXListValVLXKDMInstance(unattached));
}

TEST_F(InstanceList, LocateFindsTheFirstEqualElementFromAPosition)
{
  const VLXListValVLXKDMInstance list = Of({&A, &B, &C, &B});
  const VLXKDMInstance x(B);                                                 // another proxy of the same object
  const int starts[] = {1, 2, 3, 5, 1000, 0}, found[] = {2, 2, 4, 0, 0, 2};  // a start below 1 counts as 1
  for (int i = 0; i < 6; ++i) EXPECT_EQ(found[i], list.Locate(x, starts[i])) << starts[i];
  EXPECT_EQ(0, list.Locate(D, 1));
  EXPECT_EQ(0, list.Locate(VLXKDMInstance(), 1));
}

TEST_F(InstanceList, RemoveDuplicatesKeepsFirstOccurrencesInOrder)
{
  VLXListValVLXKDMInstance list = Of({&A, &B, &A, &A, &C}), empty;
  EXPECT_EQ(2, list.RemoveDuplicates());
  EXPECT_EQ("ABC", Letters(list));
  EXPECT_EQ(baseline + 3, GlobalRefCount());  // the removed copies are released
  list = Of({&D, &D, &D, &D});
  EXPECT_EQ(3, list.RemoveDuplicates());
  EXPECT_EQ("D", Letters(list));
  EXPECT_EQ(0, list.RemoveDuplicates());
  EXPECT_EQ(0, empty.RemoveDuplicates());
}

TEST_F(InstanceList, SizeGrowsWithCopiesOfTheFillerAndShrinksFromTheEnd)
{
  FatalRecorder recorder;
  VLXListValVLXKDMInstance list = Of({&A, &B});
  list.Size(5, &E);
  EXPECT_EQ("ABEEE", Letters(list));
  list.Size(5, nullptr);
  EXPECT_EQ("ABEEE", Letters(list));
  list.Size(1, nullptr);
  EXPECT_EQ("A", Letters(list));
  EXPECT_EQ(baseline + 1, GlobalRefCount());
  list.Size(3, nullptr);  // a null filler: unattached proxies
  EXPECT_EQ("A--", Letters(list));
  list.Size(4, &list[1]);  // the filler may be an element of the list itself
  EXPECT_EQ("A--A", Letters(list));
  list.Size(-1, &A);
  EXPECT_EQ(4, list.Size());
  EXPECT_EQ(1u, FatalRecorder::Reports().size());
  list.Size(0, nullptr);
  EXPECT_EQ(0, list.Size());
}

TEST_F(InstanceList, ArrayOfPointersExposesTheListsOwnElementsAndArrayOfProxiesCopies)
{
  VLXListValVLXKDMInstance list = Of({&A, &B, &C});
  VLXKDMInstance* pointers[3] = {};
  list.Array(pointers);
  for (int i = 0; i < 3; ++i) EXPECT_EQ(&list[i + 1], pointers[i]);
  ASSERT_EQ(VLX_S_OK, pointers[1]->SetHandle(Env(), D.GetHandle()));
  EXPECT_EQ("ADC", Letters(list));
  VLXKDMInstance proxies[3];
  list.Array(proxies);
  EXPECT_TRUE(proxies[0] == A && proxies[1] == D && proxies[2] == C);
  ASSERT_EQ(VLX_S_OK, proxies[0].SetHandle(Env(), E.GetHandle()));
  EXPECT_EQ("ADC", Letters(list));
}

// Orders elements by the letter of their object (so by identity, not by proxy address).
int ByLetter(VLXKDMInstance* a, VLXKDMInstance* b)
{
  auto rank = [](VLXKDMInstance* x) {
    for (size_t k = 0; k < gOrder->size(); ++k)
      if (*x == (*gOrder)[k]) return static_cast<int>(k);
    return -1;
  };
  return rank(a) - rank(b);
}

TEST_F(InstanceList, QuickSortMovesOnlyPointersAndCompareComparesPositionByPosition)
{
  gOrder = &o;
  VLXListValVLXKDMInstance list = Of({&C, &A, &E, &B, &A});
  VLXKDMInstance* before[5];
  list.Array(before);
  list.QuickSort(&ByLetter);
  EXPECT_EQ("AABCE", Letters(list));
  EXPECT_EQ(before[1], &list[1]);  // the first A stays the first A: same element object
  EXPECT_EQ(before[4], &list[2]);
  EXPECT_EQ(0, VLXListValVLXKDMInstance::Compare(list, Of({&A, &A, &B, &C, &E}), &ByLetter));
  EXPECT_LT(VLXListValVLXKDMInstance::Compare(list, Of({&A, &B}), &ByLetter), 0);
  EXPECT_GT(VLXListValVLXKDMInstance::Compare(list, Of({&A, &A}), &ByLetter), 0);
  gOrder = nullptr;
}

TEST_F(InstanceList, APositionOutOfRangeIsReportedAndAnsweredWithAnUnattachedProxy)
{
  FatalRecorder recorder;
  VLXListValVLXKDMInstance list = Of({&A});
  EXPECT_EQ(nullptr, list[2].GetHandle());
  EXPECT_EQ(nullptr, list[0].GetHandle());
  list.RemovePosition(3);
  EXPECT_EQ(1, list.Size());
  EXPECT_EQ(3u, FatalRecorder::Reports().size());
}

}  // namespace
