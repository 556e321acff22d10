package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.lang.reflect.Array;
import java.sql.Timestamp;
import java.util.Date;
import java.util.function.Function;
import java.util.stream.Stream;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.MethodSource;

/** Value checks, forms and copies for the seven attribute types, single and multi-valued. */
class ValuesTest {
    private Replica replica;
    private Model thing;
    private Instance x;

    @BeforeEach
    void setUp() {
        replica = new Replica("values");
        thing = addClass(replica, "Thing", null);
        x = thing.createInstance();
    }

    /** Type, single value and the exact class returned for it, the same for a multi value, a value of no accepted form. */
    static Stream<Arguments> types() {
        return Stream.of(
            row(AttributeType.Integer, t -> 42, Integer.class, t -> new int[] {1, -2, 3}, int[].class, 42L),
            row(AttributeType.Double, t -> Double.NaN, Double.class, t -> new double[] {1.5, Double.NEGATIVE_INFINITY},
                double[].class, 1.5f),
            row(AttributeType.String, t -> "h\u00e9\uD83D\uDE00", String.class, t -> new String[] {"a", ""}, String[].class, 'c'),
            row(AttributeType.Date, t -> new Date(-1234567L), Date.class, t -> new Date[] {new Date(0), new Date(17000L)},
                Date[].class, 1000L),
            row(AttributeType.Boolean, t -> Boolean.TRUE, Boolean.class, t -> new boolean[] {true, false}, boolean[].class,
                "true"),
            row(AttributeType.Binary, t -> new byte[] {0, -1, 7}, byte[].class, t -> new byte[][] {{1}, {}, {2, 3}},
                byte[][].class, new Byte[] {1}),
            row(AttributeType.Relationship, t -> t, Instance.class, t -> new Instance[] {t, t}, Instance[].class,
                new Object()));
    }

    private static Arguments row(AttributeType type, Function<Instance, Object> single, Class<?> singleClass,
            Function<Instance, Object> multi, Class<?> multiClass, Object wrong) {
        return Arguments.of(type, single, singleClass, multi, multiClass, wrong);
    }

    /** Sets every element of an array (deeply) or a date to something else. */
    private static void scramble(Object v) {
        if (v instanceof Date) {
            ((Date) v).setTime(9);
        } else if (v != null && v.getClass().isArray()) {
            for (int i = 0; i < Array.getLength(v); i++) {
                Object e = Array.get(v, i);
                if (e instanceof Date || e != null && e.getClass().isArray()) {
                    scramble(e);
                } else {
                    Array.set(v, i, e instanceof Integer ? (Object) 9 : e instanceof Double ? (Object) 9.0
                            : e instanceof Boolean ? (Object) !(Boolean) e : e instanceof Byte ? (Object) (byte) 9 : null);
                }
            }
        }
    }

    @ParameterizedTest(name = "{0}")
    @MethodSource("types")
    void acceptsOnlyItsFormsReturnsExactClassesAndCopiesBothWays(AttributeType type, Function<Instance, Object> single,
            Class<?> singleClass, Function<Instance, Object> multi, Class<?> multiClass, Object wrong) {
        addAttr(thing, "one", type, false);
        addAttr(thing, "many", type, true);
        Instance target = thing.createInstance();
        Object s = single.apply(target);
        x.setValue("one", s);
        Object back = x.getValue("one");
        assertSame(singleClass, back.getClass());
        same(s, back);
        same(back, x.getValue(0));
        Object m = multi.apply(target);
        x.setValue(1, m);
        Object backs = x.getValue("many");
        assertSame(multiClass, backs.getClass());
        same(m, backs);
        // what was given and what was returned are copies: changing them changes nothing held
        for (Object changed : new Object[] {s, back, m, backs}) {
            scramble(changed);
        }
        same(single.apply(target), x.getValue("one"));
        same(multi.apply(target), x.getValue("many"));
        throwsWith(IllegalArgumentException.class, () -> x.setValue("one", multi.apply(target)), "'Thing.one'",
                type.name(), Values.className(m));
        throwsWith(IllegalArgumentException.class, () -> x.setValue("many", single.apply(target)), "'Thing.many'",
                "multi-valued");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("one", wrong), "'Thing.one'", Values.className(wrong));
        throwsWith(IllegalArgumentException.class, () -> x.setValue("many", wrong), "'Thing.many'");
        // failed writes left the values alone
        same(single.apply(target), x.getValue("one"));
        same(multi.apply(target), x.getValue("many"));
        x.setValue("one", null);
        x.clearValue(1);
        assertFalse(x.isValuated("one") || x.isValuated(1));
        assertNull(x.getValue("one"));
        assertNull(x.getValue(1));
    }

    @Test
    void otherAcceptedFormsComeBackInTheExactClass() {
        addAttr(thing, "when", AttributeType.Date, false);
        addAttr(thing, "names", AttributeType.String, true);
        addAttr(thing, "empty", AttributeType.Integer, true);
        addAttr(thing, "code", AttributeType.String, false).setLength(3);
        x.setValue("when", new Timestamp(77));
        assertSame(Date.class, x.getValue("when").getClass());
        assertEquals(77, ((Date) x.getValue("when")).getTime());
        x.setValue("names", new Object[] {"a", "b"}); // as some native converters build it
        assertSame(String[].class, x.getValue("names").getClass());
        x.setValue("empty", new int[0]);
        assertTrue(x.isValuated("empty"), "an empty array is a value");
        x.setValue("code", "\uD83D\uDE00\uD83D\uDE00\uD83D\uDE00"); // the length counts characters, not UTF-16 units
    }

    static Stream<Arguments> refused() {
        return Stream.of(
            Arguments.of(AttributeType.String, true, 0, new String[] {"a", null}, new String[] {"element 1"}),
            Arguments.of(AttributeType.String, true, 0, new Object[] {"a", 1}, new String[] {"element 1"}),
            Arguments.of(AttributeType.Date, true, 0, new Date[] {null}, new String[] {"element 0"}),
            Arguments.of(AttributeType.Binary, true, 0, new byte[][] {{}, null}, new String[] {"element 1"}),
            Arguments.of(AttributeType.Relationship, true, 0, new Instance[] {null}, new String[] {"element 0"}),
            Arguments.of(AttributeType.String, false, 3, "abcd", new String[] {"at most 3", "has 4"}),
            Arguments.of(AttributeType.String, true, 3, new String[] {"ab", "abcd"}, new String[] {"element 1", "has 4"}),
            Arguments.of(AttributeType.Binary, false, 2, new byte[3], new String[] {"at most 2 bytes"}));
    }

    /** Null elements and values over the length (strings in characters, binaries in bytes) are refused. */
    @ParameterizedTest
    @MethodSource("refused")
    void badValuesAreRefusedNamingTheAttributeAndElement(AttributeType type, boolean multi, int length, Object value,
            String[] fragments) {
        AttributeDef a = addAttr(thing, "v", type, multi);
        a.setLength(length);
        throwsWith(IllegalArgumentException.class, () -> x.setValue("v", value), fragments);
        throwsWith(IllegalArgumentException.class, () -> x.setValue("v", value), "'Thing.v'");
        assertFalse(x.isValuated("v"));
        a.setLength(0);
        if (length > 0) {
            x.setValue("v", value); // no limit any more
        }
    }

    @Test
    void readAccessModeMakesAnAttributeReadOnly() {
        AttributeDef a = addAttr(thing, "serial", AttributeType.Integer, false);
        x.setValue("serial", 5);
        a.setAccessMode(AccessMode.Read);
        throwsWith(IllegalStateException.class, () -> x.setValue("serial", 6), "'Thing.serial'", "read-only");
        throwsWith(IllegalStateException.class, () -> x.clearValue(0), "read-only");
        assertEquals(5, x.getValue("serial"));
        a.setAccessMode(AccessMode.Write);
        x.setValue("serial", 6);
        assertEquals(6, x.getValue(0));
    }

    @Test
    void relationshipTargetsMustBeLiveInstancesOfTheReplicaAndOfATargetClass() {
        Model part = addClass(replica, "Part", null);
        Instance aPart = part.createInstance();
        Instance aBolt = addClass(replica, "Bolt", "Part").createInstance();
        AttributeDef ref = addAttr(thing, "ref", AttributeType.Relationship, false);
        Instance foreign = addClass(new Replica("elsewhere"), "Part", null).createInstance();
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", foreign), "not an instance of replica",
                "'values'");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", new Instance()), "not an instance");
        ref.setTargetNames(new String[] {"Part"});
        x.setValue("ref", aPart);
        x.setValue("ref", aBolt); // a subclass of a target class
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", thing.createInstance()), "of class 'Thing'",
                "[Part]");
        assertSame(aBolt, x.getValue("ref"));
        part.getInstances().remove(aPart);
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", aPart), "is deleted");
    }

    @Test
    void lookupsByIdentifierFollowEveryChange() {
        Replica r = replica("find", "P: n Integer; Q: n Integer");
        Model p = r.getModels().getItem("P");
        Instance a = inst(p, "n", 1);
        a.setID("a");
        Instance q = r.getModels().getItem("Q").createInstance();
        q.setID(new byte[] {1, 2});
        assertSame(a, p.findInstance("a"));
        assertSame(a, r.findInstance("a"));
        assertSame(q, r.findInstance(new byte[] {1, 2}), "bytes by content");
        a.setID("b");
        assertNull(p.findInstance("a"));
        assertSame(a, r.findInstance("b"));
        p.getInstances().remove(a);
        assertNull(r.findInstance("b"), "a deleted instance is not found");
        throwsWith(IllegalArgumentException.class, () -> r.populatesFromXmlString(
                "<replica xmlns='urn:corvexa:replica:1'><P id='c'/><P id='c'/></replica>"));
        assertNull(r.findInstance("c"), "a refused populate leaves nothing behind");
        r.populatesFromXmlString("<replica xmlns='urn:corvexa:replica:1'><P id='c'/></replica>");
        r.commit();
        Replica back = Replica.getReplicaFromBinary(Replica.getBinaryFromReplica(r, false), false);
        assertEquals("c", Replica.readFromXmlString(r.getXml(true)).findInstance("c").getID());
        assertEquals("c", back.getModels().getItem("P").findInstance("c").getID());
        throwsWith(IllegalArgumentException.class, () -> p.findInstance(42), "String or a byte[], not a");
    }

    @Test
    void selectionsFindEqualValuesInAModelAndItsSubclasses() {
        Replica r = replica("sel", "P: n Integer, tags String*, when Date; S(P): x Integer");
        Model p = r.getModels().getItem("P");
        Model s = r.getModels().getItem("S");
        Instance a = inst(p, "n", 7, "tags", new String[] {"a", "b"});
        Instance b = inst(s, "n", 7, "when", new Date(5000));
        Instance c = inst(p);
        assertArrayEquals(new Instance[] {a}, p.selectInstances("n", 7, false));
        assertArrayEquals(new Instance[] {a, b}, p.selectInstances("n", 7, true));
        assertArrayEquals(new Instance[] {b}, s.selectInstances("n", 7, false));
        assertArrayEquals(new Instance[] {a}, p.selectInstances("tags", new Object[] {"a", "b"}, true));
        assertArrayEquals(new Instance[] {b}, p.selectInstances("when", new Date(5000), true));
        assertArrayEquals(new Instance[] {c}, p.selectInstances("n", null, true), "null: without a value");
        throwsWith(IllegalArgumentException.class, () -> p.selectInstances("n", "7", false), "looked for with Integer, not java.lang.String");
        throwsWith(IllegalArgumentException.class, () -> p.selectInstances("x", 1, false), "no attribute 'x'");
    }
}
