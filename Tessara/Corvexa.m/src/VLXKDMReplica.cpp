#include "VLXKDMReplica.h"

#include <cstdint>

#include "CallFrame.h"
#include "ProxyMembers.h"
#include "VLXJBXJNIUtilities.h"

using namespace corvexa;

VLXKDM_PROXY_DEFINITIONS(VLXKDMReplica, Replica)

long VLXKDMReplica::Build()
{
  return Construct(*this, "VLXKDMReplica::Build()", Replica, slot<Replica_new>).construct();
}

long VLXKDMReplica::Build(const VLXUnicodeString& name)
{
  return Construct(*this, "VLXKDMReplica::Build(const VLXUnicodeString&)", Replica, slot<Replica_new_name>)
      .with(name)
      .construct();
}

long VLXKDMReplica::GetName(VLXUnicodeString& name) const
{
  return Call(*this, "VLXKDMReplica::GetName(VLXUnicodeString&)", slot<Replica_getName>).returning(name);
}

long VLXKDMReplica::SetName(const VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMReplica::SetName(const VLXUnicodeString&)", slot<Replica_setName>)
      .rawConversionCode()
      .with(name)
      .run();
}

long VLXKDMReplica::ToString(VLXUnicodeString& text) const
{
  return Call(*this, "VLXKDMReplica::ToString(VLXUnicodeString&)", slot<Replica_toString>).returning(text);
}

long VLXKDMReplica::Commit() { return Call(*this, "VLXKDMReplica::Commit()", slot<Replica_commit>).run(); }

long VLXKDMReplica::GetModels(VLXKDMModelSet& models) const
{
  return Call(*this, "VLXKDMReplica::GetModels(VLXKDMModelSet&)", slot<Replica_getModels>).returning(models);
}

long VLXKDMReplica::GetClassDef(const VLXUnicodeString& className, VLXKDMClassDef& classDef) const
{
  return Call(*this, "VLXKDMReplica::GetClassDef(const VLXUnicodeString&, VLXKDMClassDef&)", slot<Replica_getClassDef>)
      .with(className)
      .returning(classDef);
}

long VLXKDMReplica::GetAttributeDef(const VLXUnicodeString& attributeName, VLXKDMAttributeDef& attributeDef) const
{
  return Call(*this, "VLXKDMReplica::GetAttributeDef(const VLXUnicodeString&, VLXKDMAttributeDef&)",
              slot<Replica_getAttributeDef>)
      .with(attributeName)
      .returning(attributeDef);
}

long VLXKDMReplica::FindInstance(const VLXUnicodeString& id, VLXKDMInstance& instance) const
{
  return Call(*this, "VLXKDMReplica::FindInstance(const VLXUnicodeString&, VLXKDMInstance&)",
              slot<Replica_findInstance>)
      .with(id)
      .returning(instance);
}

long VLXKDMReplica::FindInstance(const VLXBinary& id, VLXKDMInstance& instance) const
{
  return Call(*this, "VLXKDMReplica::FindInstance(const VLXBinary&, VLXKDMInstance&)", slot<Replica_findInstance>)
      .with(id)
      .returning(instance);
}

// ---- Documents -------------------------------------------------------------------------------

long VLXKDMReplica::SetSchemaLocation(const VLXUnicodeString& location)
{
  return CallStatic("VLXKDMReplica::SetSchemaLocation(const VLXUnicodeString&)", Replica,
                    slot<Replica_setSchemaLocation>)
      .with(location)
      .run();
}

long VLXKDMReplica::GetSchemaLocation(VLXUnicodeString& location) const
{
  return Call(*this, "VLXKDMReplica::GetSchemaLocation(VLXUnicodeString&)", slot<Replica_getSchemaLocation>)
      .returning(location);
}

long VLXKDMReplica::SetFeature(const VLXUnicodeString& name, VLXBoolean value)
{
  return CallStatic("VLXKDMReplica::SetFeature(const VLXUnicodeString&, VLXBoolean)", Replica, slot<Replica_setFeature>)
      .with(name, value)
      .run();
}

long VLXKDMReplica::SetLimit(const VLXUnicodeString& name, long long value)
{
  return CallStatic("VLXKDMReplica::SetLimit(const VLXUnicodeString&, long long)", Replica, slot<Replica_setLimit>)
      .with(name, value)
      .run();
}

long VLXKDMReplica::GetLimit(const VLXUnicodeString& name, long long& value)
{
  return CallStatic("VLXKDMReplica::GetLimit(const VLXUnicodeString&, long long&)", Replica, slot<Replica_getLimit>)
      .with(name)
      .returning(value);
}

long VLXKDMReplica::SetSchemaFolder(const VLXUnicodeString& folder)
{
  return CallStatic("VLXKDMReplica::SetSchemaFolder(const VLXUnicodeString&)", Replica, slot<Replica_setSchemaFolder>)
      .with(folder)
      .run();
}

long VLXKDMReplica::GetSchemaFolder(VLXUnicodeString& folder)
{
  return CallStatic("VLXKDMReplica::GetSchemaFolder(VLXUnicodeString&)", Replica, slot<Replica_getSchemaFolder>)
      .returning(folder);
}

long VLXKDMReplica::InsertSchemaFile(const VLXUnicodeString& path)
{
  return Call(*this, "VLXKDMReplica::InsertSchemaFile(const VLXUnicodeString&)", slot<Replica_insertSchemaFile>)
      .with(path)
      .run();
}

long VLXKDMReplica::InsertSchemaString(const VLXUnicodeString& xsd)
{
  return Call(*this, "VLXKDMReplica::InsertSchemaString(const VLXUnicodeString&)", slot<Replica_insertSchemaString>)
      .with(xsd)
      .run();
}

long VLXKDMReplica::PopulatesFromXmlFile(const VLXUnicodeString& path)
{
  return Call(*this, "VLXKDMReplica::PopulatesFromXmlFile(const VLXUnicodeString&)", slot<Replica_populatesFromXmlFile>)
      .with(path)
      .run();
}

long VLXKDMReplica::PopulatesFromXmlString(const VLXUnicodeString& xml)
{
  return Call(*this, "VLXKDMReplica::PopulatesFromXmlString(const VLXUnicodeString&)",
              slot<Replica_populatesFromXmlString>)
      .with(xml)
      .run();
}

long VLXKDMReplica::ReadFromXmlFile(const VLXUnicodeString& path, VLXKDMReplica& replica)
{
  return CallStatic("VLXKDMReplica::ReadFromXmlFile(const VLXUnicodeString&, VLXKDMReplica&)", Replica,
                    slot<Replica_readFromXmlFile>)
      .with(path)
      .returning(replica);
}

long VLXKDMReplica::ReadFromXmlString(const VLXUnicodeString& xml, VLXKDMReplica& replica)
{
  return CallStatic("VLXKDMReplica::ReadFromXmlString(const VLXUnicodeString&, VLXKDMReplica&)", Replica,
                    slot<Replica_readFromXmlString>)
      .with(xml)
      .returning(replica);
}

long VLXKDMReplica::GetXml(VLXBoolean withSchema, VLXUnicodeString& xml) const
{
  return Call(*this, "VLXKDMReplica::GetXml(VLXBoolean, VLXUnicodeString&)", slot<Replica_getXml>)
      .with(withSchema)
      .returning(xml);
}

long VLXKDMReplica::GetXml(VLXBoolean withSchema, VLXBoolean withState, VLXUnicodeString& xml) const
{
  return Call(*this, "VLXKDMReplica::GetXml(VLXBoolean, VLXBoolean, VLXUnicodeString&)", slot<Replica_getXmlWithState>)
      .with(withSchema, withState)
      .returning(xml);
}

long VLXKDMReplica::GetXsd(VLXUnicodeString& xsd) const
{
  return Call(*this, "VLXKDMReplica::GetXsd(VLXUnicodeString&)", slot<Replica_getXsd>).returning(xsd);
}

long VLXKDMReplica::GetBinaryFromReplica(const VLXKDMReplica& replica, VLXBoolean compressed, VLXBinary& bytes)
{
  return CallStatic("VLXKDMReplica::GetBinaryFromReplica(const VLXKDMReplica&, VLXBoolean, VLXBinary&)", Replica,
                    slot<Replica_getBinaryFromReplica>)
      .with(replica, compressed)
      .returning(bytes);
}

long VLXKDMReplica::GetReplicaFromBinary(const VLXBinary& bytes, VLXBoolean compressed, VLXKDMReplica& replica)
{
  return CallStatic("VLXKDMReplica::GetReplicaFromBinary(const VLXBinary&, VLXBoolean, VLXKDMReplica&)", Replica,
                    slot<Replica_getReplicaFromBinary>)
      .with(bytes, compressed)
      .returning(replica);
}

long VLXKDMReplica::GetReplicaFromBinary(const VLXBinary& bytes, VLXKDMReplica& replica)
{
  return CallStatic("VLXKDMReplica::GetReplicaFromBinary(const VLXBinary&, VLXKDMReplica&)", Replica,
                    slot<Replica_getReplicaFromBinaryDetected>)
      .with(bytes)
      .returning(replica);
}

// ---- Files ---------------------------------------------------------------------------------------

long VLXKDMReplica::WriteXmlFile(const VLXUnicodeString& path, VLXBoolean withSchema, VLXBoolean withState) const
{
  return Call(*this, "VLXKDMReplica::WriteXmlFile(const VLXUnicodeString&, VLXBoolean, VLXBoolean)",
              slot<Replica_writeXmlFile>)
      .with(path, withSchema, withState)
      .run();
}

long VLXKDMReplica::WriteXsdFile(const VLXUnicodeString& path) const
{
  return Call(*this, "VLXKDMReplica::WriteXsdFile(const VLXUnicodeString&)", slot<Replica_writeXsdFile>)
      .with(path)
      .run();
}

long VLXKDMReplica::WriteBinaryFile(const VLXUnicodeString& path, VLXBoolean compressed) const
{
  return Call(*this, "VLXKDMReplica::WriteBinaryFile(const VLXUnicodeString&, VLXBoolean)",
              slot<Replica_writeBinaryFile>)
      .with(path, compressed)
      .run();
}

long VLXKDMReplica::ReadBinaryFile(const VLXUnicodeString& path, VLXKDMReplica& replica)
{
  return CallStatic("VLXKDMReplica::ReadBinaryFile(const VLXUnicodeString&, VLXKDMReplica&)", Replica,
                    slot<Replica_readBinaryFile>)
      .with(path)
      .returning(replica);
}

// ---- Progress ------------------------------------------------------------------------------------
// The handler and its context cross to Java as two numbers, kept per thread on the Java side, which
// gives them back to the native method below with each report.

long VLXKDMReplica::SetProgressHandler(VLXKDMProgressHandler handler, void* context)
{
  const long long function = static_cast<long long>(reinterpret_cast<std::intptr_t>(handler));
  const long long data = handler ? static_cast<long long>(reinterpret_cast<std::intptr_t>(context)) : 0;
  return CallStatic("VLXKDMReplica::SetProgressHandler(VLXKDMProgressHandler, void*)", Progress,
                    slot<Progress_setNative>)
      .with(function, data)
      .run();
}

namespace {

// Progress.callNative: one report to a handler (one that throws stops the operation).
jboolean JNICALL CallProgressHandler(JNIEnv*, jclass, jlong function, jlong context, jlong done, jlong total)
{
  const auto handler = reinterpret_cast<VLXKDMProgressHandler>(static_cast<std::intptr_t>(function));
  try {
    return handler(done, total, reinterpret_cast<void*>(static_cast<std::intptr_t>(context))) ? JNI_TRUE : JNI_FALSE;
  } catch (...) {
    return JNI_FALSE;
  }
}

}  // namespace

long corvexa::RegisterProgressNative(JNIEnv* env, const ReplicaStubs& table)
{
  static const JNINativeMethod method = {const_cast<char*>("callNative"), const_cast<char*>("(JJJJ)Z"),
                                         reinterpret_cast<void*>(&CallProgressHandler)};
  return VLXJBXJNIHelper::RegisterNatives(env, table.Class(Progress), &method, 1) == JNI_OK ? VLX_S_OK : VLX_E_FAIL;
}

// ---- Exchange with Java ------------------------------------------------------------------------
// These run on a Java thread that called native code: they end with the bridge's Java error
// handling instead of the error translation, and the references they hand out belong to the
// calling Java frame.

long VLXKDMReplica::BuildFromJavaType(JNIEnv* env, jobject replica)
{
  exchangedWithJava = 1;
  return SetGlobalRef(env, replica);
}

long VLXKDMReplica::ConvertToJavaType(JNIEnv* env, jobject& replica)
{
  const char* const name = "VLXKDMReplica::ConvertToJavaType(JNIEnv*, jobject&)";
  long status = VLX_S_OK;
  if (!FrameAccess::StartJavaFacing(env, name, status)) return status;
  exchangedWithJava = 1;
  replica = VLXJBXJNIHelper::NewLocalRef(env, GetHandle());
  return VLXJBXJNIUtilities::HandleJavaError(env, status, name, nullptr, 0);
}

long VLXKDMReplica::BuildFromJavaHolder(JNIEnv* env, jobject holder)
{
  const char* const name = "VLXKDMReplica::BuildFromJavaHolder(JNIEnv*, jobject)";
  long status = VLX_S_OK;
  const ReplicaStubs* st = FrameAccess::StartJavaFacing(env, name, status);
  if (!st) return status;
  const long checked = CheckJavaClass(env, holder, ReplicaHolder, name);
  if (checked < 0) return checked;
  const LocalRef replica(env, VLXJBXJNIHelper::CallObjectMethod(env, holder, st->Method(ReplicaHolder_getValue)));
  if (VLXJBXJNIHelper::ExceptionCheck(env)) {
    status = VLX_E_FAIL;
  } else {
    exchangedWithJava = 1;
    status = SetGlobalRef(env, replica.get());
  }
  return VLXJBXJNIUtilities::HandleJavaError(env, status, name, nullptr, 0);
}

long VLXKDMReplica::ConvertToJavaHolder(JNIEnv* env, jobject& holder)
{
  const char* const name = "VLXKDMReplica::ConvertToJavaHolder(JNIEnv*, jobject&)";
  long status = VLX_S_OK;
  const ReplicaStubs* st = FrameAccess::StartJavaFacing(env, name, status);
  if (!st) return status;
  if (holder) {
    const long checked = CheckJavaClass(env, holder, ReplicaHolder, name);
    if (checked < 0) return checked;
  }

  // A holder made here is handed out only when it holds the replica.
  LocalRef created(
      env, holder ? nullptr : VLXJBXJNIHelper::NewObject(env, st->Class(ReplicaHolder), st->Method(ReplicaHolder_new)));
  const jobject target = holder ? holder : created.get();
  if (!target) return VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_FAIL, name, nullptr, 0);

  status = VLX_E_FAIL;
  jobject replica = nullptr;
  if (ConvertToJavaType(env, replica) >= 0) {
    const LocalRef owned(env, replica);
    VLXJBXJNIHelper::CallVoidMethod(env, target, st->Method(ReplicaHolder_setValue), replica);
    if (!VLXJBXJNIHelper::ExceptionCheck(env)) {
      if (!holder) holder = created.release();
      status = VLX_S_OK;
    }
  }
  return VLXJBXJNIUtilities::HandleJavaError(env, status, name, nullptr, 0);
}
