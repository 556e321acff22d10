package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.lang.reflect.Constructor;
import java.lang.reflect.Executable;
import java.lang.reflect.Field;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.util.Arrays;
import java.util.stream.Stream;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.MethodSource;
import org.junit.jupiter.params.provider.ValueSource;

/**
 * Every member that the native library resolves at start-up exists with its exact name, JNI
 * signature and static-ness; the proxied classes can be subclassed as test doubles; and the
 * enumeration constants are static fields of the enumeration's own type.
 */
class BindingTableTest {
    /** class path, optional "static", member, JNI signature. */
    static Stream<String> members() {
        return Stream.of(
            "com/velmora/tessara/kdmreplica/AttributeDef <init> (Ljava/lang/String;Lcom/velmora/tessara/kdmreplica/AttributeType;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef <init> ()V",
            "com/velmora/tessara/kdmreplica/AttributeDef toString ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/AttributeDef getTargetNames ()[Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/AttributeDef setTargetNames ([Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef getTargetRefs ()[Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/AttributeDef setTargetRefs ([Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef getAggregationType ()Lcom/velmora/tessara/kdmreplica/AggregationType;",
            "com/velmora/tessara/kdmreplica/AttributeDef setAggregationType (Lcom/velmora/tessara/kdmreplica/AggregationType;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef setMultiValuation (Z)V",
            "com/velmora/tessara/kdmreplica/AttributeDef isMultiValuated ()Z",
            "com/velmora/tessara/kdmreplica/AttributeDef getUuid ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/AttributeDef setUuid (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef getQKAComment ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/AttributeDef setQKAComment (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef setLength (I)V",
            "com/velmora/tessara/kdmreplica/AttributeDef getLength ()I",
            "com/velmora/tessara/kdmreplica/AttributeDef setAccessMode (Lcom/velmora/tessara/kdmreplica/vrattributes/AccessMode;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef getAccessMode ()Lcom/velmora/tessara/kdmreplica/vrattributes/AccessMode;",
            "com/velmora/tessara/kdmreplica/AttributeDef setSoftwareVisibility (Lcom/velmora/tessara/kdmreplica/vrattributes/Visibility;)V",
            "com/velmora/tessara/kdmreplica/AttributeDef getSoftwareVisibility ()Lcom/velmora/tessara/kdmreplica/vrattributes/Visibility;",
            "com/velmora/tessara/kdmreplica/AttributeDef setMandatory (Z)V",
            "com/velmora/tessara/kdmreplica/AttributeDef isMandatory ()Z",
            "com/velmora/tessara/kdmreplica/AttributeDef setUnicity (Z)V",
            "com/velmora/tessara/kdmreplica/AttributeDef isUnique ()Z",
            "com/velmora/tessara/kdmreplica/AttributeDef getClassDef ()Lcom/velmora/tessara/kdmreplica/ClassDef;",
            "com/velmora/tessara/kdmreplica/AttributeDef getAttributeType ()Lcom/velmora/tessara/kdmreplica/AttributeType;",
            "com/velmora/tessara/kdmreplica/AttributeDef getAttributeName ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/AttributeDefList <init> ()V",
            "com/velmora/tessara/kdmreplica/AttributeDefList getCount ()I",
            "com/velmora/tessara/kdmreplica/AttributeDefList remove (I)V",
            "com/velmora/tessara/kdmreplica/AttributeDefList remove (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/AttributeDefList remove (Lcom/velmora/tessara/kdmreplica/AttributeDef;)V",
            "com/velmora/tessara/kdmreplica/AttributeDefList indexOf (Ljava/lang/String;)I",
            "com/velmora/tessara/kdmreplica/AttributeDefList indexOf (Lcom/velmora/tessara/kdmreplica/AttributeDef;)I",
            "com/velmora/tessara/kdmreplica/AttributeDefList includes (Ljava/lang/String;)Z",
            "com/velmora/tessara/kdmreplica/AttributeDefList add (Lcom/velmora/tessara/kdmreplica/AttributeDef;)V",
            "com/velmora/tessara/kdmreplica/AttributeDefList getItem (Ljava/lang/String;)Lcom/velmora/tessara/kdmreplica/AttributeDef;",
            "com/velmora/tessara/kdmreplica/AttributeDefList getItem (I)Lcom/velmora/tessara/kdmreplica/AttributeDef;",
            "com/velmora/tessara/kdmreplica/ClassDef <init> (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/ClassDef <init> ()V",
            "com/velmora/tessara/kdmreplica/ClassDef toString ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/ClassDef getUuid ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/ClassDef setUuid (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/ClassDef setScopeNames ([Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/ClassDef getScopeNames ()[Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/ClassDef setQKADerivability (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/ClassDef getQKADerivability ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/ClassDef setExtensibility (Z)V",
            "com/velmora/tessara/kdmreplica/ClassDef isExtensible ()Z",
            "com/velmora/tessara/kdmreplica/ClassDef setSoftwareVisibility (Lcom/velmora/tessara/kdmreplica/vrattributes/Visibility;)V",
            "com/velmora/tessara/kdmreplica/ClassDef getSoftwareVisibility ()Lcom/velmora/tessara/kdmreplica/vrattributes/Visibility;",
            "com/velmora/tessara/kdmreplica/ClassDef setAbstract (Z)V",
            "com/velmora/tessara/kdmreplica/ClassDef isAbstract ()Z",
            "com/velmora/tessara/kdmreplica/ClassDef setPersistency (Z)V",
            "com/velmora/tessara/kdmreplica/ClassDef isPersistent ()Z",
            "com/velmora/tessara/kdmreplica/ClassDef setSuperName (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/ClassDef getSuperName ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/ClassDef setClassType (Lcom/velmora/tessara/kdmreplica/ClassType;)V",
            "com/velmora/tessara/kdmreplica/ClassDef getClassType ()Lcom/velmora/tessara/kdmreplica/ClassType;",
            "com/velmora/tessara/kdmreplica/ClassDef getAttributes ()Lcom/velmora/tessara/kdmreplica/AttributeDefList;",
            "com/velmora/tessara/kdmreplica/ClassDef setClassName (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/ClassDef getClassName ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/ClassDef getQKAComment ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/ClassDef setQKAComment (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Instance <init> ()V",
            "com/velmora/tessara/kdmreplica/Instance isDeleted ()Z",
            "com/velmora/tessara/kdmreplica/Instance isModified ()Z",
            "com/velmora/tessara/kdmreplica/Instance isCreated ()Z",
            "com/velmora/tessara/kdmreplica/Instance toString (Z)Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Instance toString ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Instance setID (Ljava/lang/Object;)V",
            "com/velmora/tessara/kdmreplica/Instance getID ()Ljava/lang/Object;",
            "com/velmora/tessara/kdmreplica/Instance getClassDef ()Lcom/velmora/tessara/kdmreplica/ClassDef;",
            "com/velmora/tessara/kdmreplica/Instance isValuated (Ljava/lang/String;)Z",
            "com/velmora/tessara/kdmreplica/Instance isValuated (I)Z",
            "com/velmora/tessara/kdmreplica/Instance setValue (ILjava/lang/Object;)V",
            "com/velmora/tessara/kdmreplica/Instance setValue (Ljava/lang/String;Ljava/lang/Object;)V",
            "com/velmora/tessara/kdmreplica/Instance clearValue (I)V",
            "com/velmora/tessara/kdmreplica/Instance clearValue (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Instance getValue (I)Ljava/lang/Object;",
            "com/velmora/tessara/kdmreplica/Instance getValue (Ljava/lang/String;)Ljava/lang/Object;",
            "com/velmora/tessara/kdmreplica/InstanceSet <init> ()V",
            "com/velmora/tessara/kdmreplica/InstanceSet removeAll ()V",
            "com/velmora/tessara/kdmreplica/InstanceSet getCount ()I",
            "com/velmora/tessara/kdmreplica/InstanceSet remove (I)V",
            "com/velmora/tessara/kdmreplica/InstanceSet remove (Lcom/velmora/tessara/kdmreplica/Instance;)V",
            "com/velmora/tessara/kdmreplica/InstanceSet indexOf (Lcom/velmora/tessara/kdmreplica/Instance;)I",
            "com/velmora/tessara/kdmreplica/InstanceSet getItem (I)Lcom/velmora/tessara/kdmreplica/Instance;",
            "com/velmora/tessara/kdmreplica/Model <init> (Lcom/velmora/tessara/kdmreplica/ClassDef;)V",
            "com/velmora/tessara/kdmreplica/Model <init> ()V",
            "com/velmora/tessara/kdmreplica/Model toString ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Model getReplica ()Lcom/velmora/tessara/kdmreplica/Replica;",
            "com/velmora/tessara/kdmreplica/Model createInstance ()Lcom/velmora/tessara/kdmreplica/Instance;",
            "com/velmora/tessara/kdmreplica/Model getInstances ()Lcom/velmora/tessara/kdmreplica/InstanceSet;",
            "com/velmora/tessara/kdmreplica/Model getClassDef ()Lcom/velmora/tessara/kdmreplica/ClassDef;",
            "com/velmora/tessara/kdmreplica/ModelSet <init> ()V",
            "com/velmora/tessara/kdmreplica/ModelSet remove (I)V",
            "com/velmora/tessara/kdmreplica/ModelSet remove (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/ModelSet remove (Lcom/velmora/tessara/kdmreplica/ClassDef;)V",
            "com/velmora/tessara/kdmreplica/ModelSet indexOf (Ljava/lang/String;)I",
            "com/velmora/tessara/kdmreplica/ModelSet indexOf (Lcom/velmora/tessara/kdmreplica/ClassDef;)I",
            "com/velmora/tessara/kdmreplica/ModelSet includes (Ljava/lang/String;)Z",
            "com/velmora/tessara/kdmreplica/ModelSet add (Lcom/velmora/tessara/kdmreplica/Model;)V",
            "com/velmora/tessara/kdmreplica/ModelSet getItem (Ljava/lang/String;)Lcom/velmora/tessara/kdmreplica/Model;",
            "com/velmora/tessara/kdmreplica/ModelSet getItem (I)Lcom/velmora/tessara/kdmreplica/Model;",
            "com/velmora/tessara/kdmreplica/ModelSet getCount ()I",
            "com/velmora/tessara/kdmreplica/Replica <init> (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Replica <init> ()V",
            "com/velmora/tessara/kdmreplica/Replica commit ()V",
            "com/velmora/tessara/kdmreplica/Replica getAttributeDef (Ljava/lang/String;)Lcom/velmora/tessara/kdmreplica/AttributeDef;",
            "com/velmora/tessara/kdmreplica/Replica getClassDef (Ljava/lang/String;)Lcom/velmora/tessara/kdmreplica/ClassDef;",
            "com/velmora/tessara/kdmreplica/Replica toString ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Replica static setFeature (Ljava/lang/String;Z)V",
            "com/velmora/tessara/kdmreplica/Replica static getBinaryFromReplica (Lcom/velmora/tessara/kdmreplica/Replica;Z)[B",
            "com/velmora/tessara/kdmreplica/Replica static getReplicaFromBinary ([BZ)Lcom/velmora/tessara/kdmreplica/Replica;",
            "com/velmora/tessara/kdmreplica/Replica getSchemaLocation ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Replica static setSchemaLocation (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Replica insertSchemaString (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Replica insertSchemaFile (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Replica populatesFromXmlString (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Replica populatesFromXmlFile (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Replica static readFromXmlString (Ljava/lang/String;)Lcom/velmora/tessara/kdmreplica/Replica;",
            "com/velmora/tessara/kdmreplica/Replica static readFromXmlFile (Ljava/lang/String;)Lcom/velmora/tessara/kdmreplica/Replica;",
            "com/velmora/tessara/kdmreplica/Replica getXsd ()Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Replica getXml (ZZ)Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Replica getXml (Z)Ljava/lang/String;",
            "com/velmora/tessara/kdmreplica/Replica getModels ()Lcom/velmora/tessara/kdmreplica/ModelSet;",
            "com/velmora/tessara/kdmreplica/Replica setName (Ljava/lang/String;)V",
            "com/velmora/tessara/kdmreplica/Replica getName ()Ljava/lang/String;",
            "com/velmora/tessara/ReplicaHolder <init> ()V",
            "com/velmora/tessara/ReplicaHolder getValue ()Lcom/velmora/tessara/kdmreplica/Replica;",
            "com/velmora/tessara/ReplicaHolder setValue (Lcom/velmora/tessara/kdmreplica/Replica;)V");
    }

    private static String descriptor(Class<?> c) {
        if (c.isArray()) {
            return c.getName().replace('.', '/');
        }
        if (c.isPrimitive()) {
            return Character.toString(c == boolean.class ? 'Z' : c == byte.class ? 'B' : c == char.class ? 'C'
                    : c == short.class ? 'S' : c == int.class ? 'I' : c == long.class ? 'J' : c == float.class ? 'F'
                    : c == double.class ? 'D' : 'V');
        }
        return "L" + c.getName().replace('.', '/') + ";";
    }

    private static String signature(Executable e) {
        StringBuilder b = new StringBuilder("(");
        for (Class<?> p : e.getParameterTypes()) {
            b.append(descriptor(p));
        }
        b.append(')');
        b.append(e instanceof Method ? descriptor(((Method) e).getReturnType()) : "V");
        return b.toString();
    }

    @ParameterizedTest(name = "{0}")
    @MethodSource("members")
    void memberExistsWithItsSignature(String row) throws Exception {
        String[] f = row.split(" ");
        Class<?> c = Class.forName(f[0].replace('/', '.'));
        boolean isStatic = f[1].equals("static");
        String name = f[isStatic ? 2 : 1];
        String sig = f[isStatic ? 3 : 2];
        Stream<Executable> candidates = name.equals("<init>") ? Arrays.stream(c.getConstructors())
                : Arrays.stream(c.getMethods()).filter(m -> m.getName().equals(name)).map(m -> (Executable) m);
        Executable e = candidates.filter(x -> signature(x).equals(sig)).findFirst()
                .orElseThrow(() -> new AssertionError(row + " is missing"));
        assertTrue(Modifier.isPublic(e.getModifiers()), row);
        assertEquals(isStatic, Modifier.isStatic(e.getModifiers()), row);
        if (!isStatic && !(e instanceof Constructor)) {
            assertFalse(Modifier.isFinal(e.getModifiers()), row + " must stay overridable for test doubles");
        }
    }

    @ParameterizedTest
    @ValueSource(strings = {"AttributeDef", "AttributeDefList", "ClassDef", "Instance", "InstanceSet", "Model",
            "ModelSet", "Replica"})
    void proxiedClassesArePublicAndNotFinal(String name) throws Exception {
        Class<?> c = Class.forName("com.velmora.tessara.kdmreplica." + name);
        assertTrue(Modifier.isPublic(c.getModifiers()));
        assertFalse(Modifier.isFinal(c.getModifiers()));
        assertTrue(c.getConstructor().newInstance().toString().length() > 0);
    }

    @ParameterizedTest
    @ValueSource(strings = {"AttributeType:Integer,Double,String,Date,Boolean,Binary,Relationship",
            "vrattributes.AccessMode:Read,Write,ReadWrite", "AggregationType:Composition,Shared",
            "ClassType:Class,Extension", "vrattributes.Visibility:Public,Protected,Private"})
    void enumerationConstantsAreStaticFieldsOfTheirOwnType(String row) throws Exception {
        String[] parts = row.split(":");
        Class<?> c = Class.forName("com.velmora.tessara.kdmreplica." + parts[0]);
        for (String constant : parts[1].split(",")) {
            Field f = c.getField(constant);
            assertSame(c, f.getType());
            assertTrue(Modifier.isStatic(f.getModifiers()));
            assertSame(f.get(null), f.get(null));
        }
    }
}
