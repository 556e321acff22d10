// Replicas with classes of every attribute type, built through the library, for the data tests.
#pragma once

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "JavaTestSupport.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"

namespace corvexa_test {

struct AttributeShape {
  const char* name;
  VLXKDMAttributeType::Type type;
  bool multi;
};

// The attributes of the class "Sample": one of each type, then one list of each type, so that the
// attribute at position p (from 0) is single for p < 7 and a list of the same type at p + 7.
inline const std::vector<AttributeShape>& SampleAttributes()
{
  static const std::vector<AttributeShape> attributes = {
      {"integer", VLXKDMAttributeType::Integer, false},   {"double", VLXKDMAttributeType::Double, false},
      {"string", VLXKDMAttributeType::String, false},     {"date", VLXKDMAttributeType::Date, false},
      {"boolean", VLXKDMAttributeType::Boolean, false},   {"binary", VLXKDMAttributeType::Binary, false},
      {"instance", VLXKDMAttributeType::Relationship, false},
      {"integers", VLXKDMAttributeType::Integer, true},   {"doubles", VLXKDMAttributeType::Double, true},
      {"strings", VLXKDMAttributeType::String, true},     {"dates", VLXKDMAttributeType::Date, true},
      {"booleans", VLXKDMAttributeType::Boolean, true},   {"binaries", VLXKDMAttributeType::Binary, true},
      {"instances", VLXKDMAttributeType::Relationship, true},
  };
  return attributes;
}

// Adds a class with the given attributes to the replica, with its model; model is attached to it.
inline void AddClass(VLXKDMReplica& replica, const char* className, const std::vector<AttributeShape>& attributes,
                     VLXKDMModel& model)
{
  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, classDef.Build(VLXUnicodeString(className)));
  VLXKDMAttributeDefList list;
  ASSERT_EQ(VLX_S_OK, classDef.GetAttributes(list));
  for (const AttributeShape& shape : attributes) {
    VLXKDMAttributeDef attribute;
    ASSERT_EQ(VLX_S_OK, attribute.Build(VLXUnicodeString(shape.name), shape.type));
    ASSERT_EQ(VLX_S_OK, attribute.SetMultiValuation(shape.multi ? 1 : 0));
    ASSERT_EQ(VLX_S_OK, list.Add(attribute));
  }
  ASSERT_EQ(VLX_S_OK, model.Build(classDef));
  VLXKDMModelSet models;
  ASSERT_EQ(VLX_S_OK, replica.GetModels(models));
  ASSERT_EQ(VLX_S_OK, models.Add(model));
}

// A replica holding the class "Sample" (SampleAttributes) and its model.
struct SampleReplica {
  VLXKDMReplica replica;
  VLXKDMModel model;

  explicit SampleReplica(const char* name = "samples")
  {
    EXPECT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString(name)));
    AddClass(replica, "Sample", SampleAttributes(), model);
  }

  VLXKDMInstance Create()
  {
    VLXKDMInstance instance;
    EXPECT_EQ(VLX_S_OK, model.CreateInstance(instance));
    return instance;
  }
};

// The method name text that the thread's last error carries as its first parameter.
inline std::string LastErrorOperation()
{
  const LastError error = PeekLastError();
  return error.parameters.empty() ? std::string() : error.parameters[0];
}

}  // namespace corvexa_test
