// The binding table's slot numbers and its filling against the real replica package.
#include <gtest/gtest.h>

#include "JavaTestSupport.h"
#include "ReplicaStubs.h"
#include "VLXKDMReplica.h"

using namespace corvexa;
using namespace corvexa_test;

namespace {

// The slot numbers are part of the library's contract with the Java side.
static_assert(AttributeDef == 0 && AttributeDef_getAttributeName == 28, "AttributeDef group");
static_assert(AttributeDefList == 29 && AttributeDefList_getItemAt == 40, "AttributeDefList group");
static_assert(ClassDef == 41 && ClassDef_getQKAComment == 66 && ClassDef_setQKAComment == 67, "ClassDef group");
static_assert(Instance == 68 && Instance_getValueNamed == 85, "Instance group");
static_assert(InstanceSet == 86 && InstanceSet_getItem == 93, "InstanceSet group");
static_assert(Model == 94 && Model_getClassDef == 101, "Model group");
static_assert(ModelSet == 102 && ModelSet_getCount == 113, "ModelSet group");
static_assert(Replica == 114 && Replica_setFeature == 121 && Replica_getName == 137, "Replica group");
static_assert(ReplicaHolder == 138 && ReplicaHolder_setValue == 141, "ReplicaHolder group");
static_assert(String == 142 && Double == 145 && Integer == 148 && Date == 151 && Boolean == 154, "boxes");
static_assert(ByteArray == 157 && InstanceArray == 164, "array classes");
static_assert(AttributeType == 165 && AttributeType_Relationship == 172 && AttributeType_reserved == 173,
              "AttributeType constants");
static_assert(AccessMode == 174 && AccessMode_ReadWrite == 177, "AccessMode constants");
static_assert(AggregationType == 178 && AggregationType_Shared == 180, "AggregationType constants");
static_assert(ClassType == 181 && ClassType_Extension == 183, "ClassType constants");
static_assert(Visibility == 184 && Visibility_Private == 187, "Visibility constants");

struct TableReader : VLXKDMJavaObject {
  static ReplicaStubs* Table() { return _st.load(); }
};

TEST(BindingTable, EverySlotButTheReservedOneIsFilledAndConstantsAreDistinct)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build());
  const ReplicaStubs* table = TableReader::Table();
  ASSERT_NE(nullptr, table);
  ASSERT_TRUE(table->IsBound());
  for (int slot = 0; slot < SlotCount; ++slot) {
    SCOPED_TRACE(slot);
    const void* entry = table->Constant(static_cast<Slot>(slot));
    if (slot == AttributeType_reserved)
      EXPECT_EQ(nullptr, entry);
    else
      EXPECT_NE(nullptr, entry);
  }
  // Overloads are told apart by signature.
  EXPECT_NE(table->Method(Instance_getValueAt), table->Method(Instance_getValueNamed));
  EXPECT_NE(table->Method(Replica_getXml), table->Method(Replica_getXmlWithState));
  EXPECT_NE(table->Method(Replica_new), table->Method(Replica_new_name));

  JNIEnv* env = Env();
  EXPECT_FALSE(env->IsSameObject(table->Constant(AttributeType_Integer), table->Constant(AttributeType_Double)));
  EXPECT_FALSE(env->IsSameObject(table->Constant(Visibility_Public), table->Constant(Visibility_Private)));
  jclass accessMode = table->Class(AccessMode);
  EXPECT_TRUE(env->IsInstanceOf(table->Constant(AccessMode_Write), accessMode));
}

}  // namespace
