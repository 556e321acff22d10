package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNotSame;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
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

    /**
     * type, single value, exact class returned for it, multi value, exact class returned for it,
     * a value of no accepted form. Relationship values are made from a target instance.
     */
    static Stream<Arguments> types() {
        return Stream.of(
                row(AttributeType.Integer, t -> 42, Integer.class, t -> new int[] {1, -2, 3}, int[].class, 42L),
                row(AttributeType.Double, t -> Double.NaN, Double.class, t -> new double[] {1.5, Double.NEGATIVE_INFINITY},
                        double[].class, 1.5f),
                row(AttributeType.String, t -> "h\u00e9\uD83D\uDE00", String.class, t -> new String[] {"a", ""},
                        String[].class, 'c'),
                row(AttributeType.Date, t -> new Date(-1234567L), Date.class,
                        t -> new Date[] {new Date(0), new Date(1700000000123L)}, Date[].class, 1000L),
                row(AttributeType.Boolean, t -> Boolean.TRUE, Boolean.class, t -> new boolean[] {true, false},
                        boolean[].class, "true"),
                row(AttributeType.Binary, t -> new byte[] {0, -1, 7}, byte[].class,
                        t -> new byte[][] {{1}, {}, {2, 3}}, byte[][].class, new Byte[] {1}),
                row(AttributeType.Relationship, t -> t, Instance.class, t -> new Instance[] {t, t}, Instance[].class,
                        new Object()));
    }

    private static Arguments row(AttributeType type, Function<Instance, Object> single, Class<?> singleClass,
            Function<Instance, Object> multi, Class<?> multiClass, Object wrong) {
        return Arguments.of(type, single, singleClass, multi, multiClass, wrong);
    }

    private static void assertSameContent(Object expected, Object actual) {
        assertArrayEquals(new Object[] {expected}, new Object[] {actual});
    }

    @ParameterizedTest(name = "{0}")
    @MethodSource("types")
    void acceptsOnlyItsFormsAndReturnsExactClasses(AttributeType type, Function<Instance, Object> single,
            Class<?> singleClass, Function<Instance, Object> multi, Class<?> multiClass, Object wrong) {
        addAttr(thing, "one", type, false);
        addAttr(thing, "many", type, true);
        Instance target = thing.createInstance();

        Object s = single.apply(target);
        x.setValue("one", s);
        Object back = x.getValue("one");
        assertSame(singleClass, back.getClass());
        assertSameContent(s, back);
        assertSameContent(back, x.getValue(0));

        Object m = multi.apply(target);
        x.setValue(1, m);
        Object backs = x.getValue("many");
        assertSame(multiClass, backs.getClass());
        assertSameContent(m, backs);

        throwsWith(IllegalArgumentException.class, () -> x.setValue("one", m), "'Thing.one'", type.name(),
                Values.className(m));
        throwsWith(IllegalArgumentException.class, () -> x.setValue("many", s), "'Thing.many'", "multi-valued");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("one", wrong), "'Thing.one'",
                Values.className(wrong));
        throwsWith(IllegalArgumentException.class, () -> x.setValue("many", wrong), "'Thing.many'");
        // failed writes left the values alone
        assertSameContent(s, x.getValue("one"));
        assertSameContent(m, x.getValue("many"));

        x.setValue("one", null);
        x.clearValue(1);
        assertFalse(x.isValuated("one"));
        assertFalse(x.isValuated(1));
        assertNull(x.getValue("one"));
        assertNull(x.getValue(1));
    }

    @Test
    void arraysBytesAndDatesAreCopiedBothWays() {
        addAttr(thing, "ints", AttributeType.Integer, true);
        addAttr(thing, "bin", AttributeType.Binary, false);
        addAttr(thing, "bins", AttributeType.Binary, true);
        addAttr(thing, "when", AttributeType.Date, false);
        addAttr(thing, "whens", AttributeType.Date, true);
        addAttr(thing, "names", AttributeType.String, true);
        addAttr(thing, "refs", AttributeType.Relationship, true);
        Instance t = thing.createInstance();

        int[] ints = {1, 2};
        byte[] bin = {1, 2};
        byte[][] bins = {{1}, {2}};
        Date when = new Date(5000);
        Date[] whens = {new Date(6000)};
        String[] names = {"a"};
        Instance[] refs = {t};
        x.setValue("ints", ints);
        x.setValue("bin", bin);
        x.setValue("bins", bins);
        x.setValue("when", when);
        x.setValue("whens", whens);
        x.setValue("names", names);
        x.setValue("refs", refs);

        ints[0] = 9;
        bin[0] = 9;
        bins[0][0] = 9;
        bins[1] = new byte[] {9};
        when.setTime(9);
        whens[0].setTime(9);
        names[0] = "z";
        refs[0] = x;
        ((int[]) x.getValue("ints"))[1] = 9;
        ((byte[]) x.getValue("bin"))[1] = 9;
        ((byte[][]) x.getValue("bins"))[1][0] = 9;
        ((Date) x.getValue("when")).setTime(9);
        ((Date[]) x.getValue("whens"))[0].setTime(9);
        ((String[]) x.getValue("names"))[0] = "z";
        ((Instance[]) x.getValue("refs"))[0] = x;

        assertArrayEquals(new int[] {1, 2}, (int[]) x.getValue("ints"));
        assertArrayEquals(new byte[] {1, 2}, (byte[]) x.getValue("bin"));
        assertArrayEquals(new byte[][] {{1}, {2}}, (byte[][]) x.getValue("bins"));
        assertEquals(5000, ((Date) x.getValue("when")).getTime());
        assertEquals(6000, ((Date[]) x.getValue("whens"))[0].getTime());
        assertArrayEquals(new String[] {"a"}, (String[]) x.getValue("names"));
        assertSame(t, ((Instance[]) x.getValue("refs"))[0]);
        assertNotSame(x.getValue("bin"), x.getValue("bin"));
    }

    @Test
    void otherAcceptedFormsComeBackInTheExactClass() {
        addAttr(thing, "when", AttributeType.Date, false);
        addAttr(thing, "names", AttributeType.String, true);
        addAttr(thing, "empty", AttributeType.Integer, true);
        x.setValue("when", new Timestamp(77));
        assertSame(Date.class, x.getValue("when").getClass());
        assertEquals(77, ((Date) x.getValue("when")).getTime());
        // a plain Object[] of strings (as some native converters build it) is stored as String[]
        x.setValue("names", new Object[] {"a", "b"});
        assertSame(String[].class, x.getValue("names").getClass());
        throwsWith(IllegalArgumentException.class, () -> x.setValue("names", new Object[] {"a", 1}), "element 1");
        // an empty array is a value
        x.setValue("empty", new int[0]);
        assertTrue(x.isValuated("empty"));
        assertEquals(0, ((int[]) x.getValue("empty")).length);
    }

    @Test
    void nullElementsAreRefusedAndNamed() {
        addAttr(thing, "names", AttributeType.String, true);
        addAttr(thing, "whens", AttributeType.Date, true);
        addAttr(thing, "bins", AttributeType.Binary, true);
        addAttr(thing, "refs", AttributeType.Relationship, true);
        throwsWith(IllegalArgumentException.class, () -> x.setValue("names", new String[] {"a", null}), "element 1");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("whens", new Date[] {null}), "element 0");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("bins", new byte[][] {{}, null}), "element 1");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("refs", new Instance[] {x, null}), "element 1");
        assertFalse(x.isValuated("names") || x.isValuated("whens") || x.isValuated("bins") || x.isValuated("refs"));
    }

    @Test
    void lengthLimitsStringsInCharactersAndBinariesInBytes() {
        AttributeDef s = addAttr(thing, "code", AttributeType.String, false);
        AttributeDef ss = addAttr(thing, "codes", AttributeType.String, true);
        AttributeDef b = addAttr(thing, "blob", AttributeType.Binary, false);
        s.setLength(3);
        ss.setLength(3);
        b.setLength(2);
        x.setValue("code", "\uD83D\uDE00\uD83D\uDE00\uD83D\uDE00"); // three characters, six UTF-16 units
        throwsWith(IllegalArgumentException.class, () -> x.setValue("code", "abcd"), "'Thing.code'", "at most 3",
                "has 4");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("codes", new String[] {"ab", "abcd"}),
                "element 1", "has 4");
        x.setValue("blob", new byte[2]);
        throwsWith(IllegalArgumentException.class, () -> x.setValue("blob", new byte[3]), "at most 2 bytes");
        s.setLength(0);
        x.setValue("code", "no limit any more");
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
        Model bolt = addClass(replica, "Bolt", "Part");
        AttributeDef ref = addAttr(thing, "ref", AttributeType.Relationship, false);
        Instance aPart = part.createInstance();
        Instance aBolt = bolt.createInstance();
        Instance other = thing.createInstance();

        Replica elsewhere = new Replica("elsewhere");
        Instance foreign = addClass(elsewhere, "Part", null).createInstance();
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", foreign), "not an instance of replica",
                "'values'");
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", new Instance()), "not an instance");

        ref.setTargetNames(new String[] {"Part"});
        x.setValue("ref", aPart);
        x.setValue("ref", aBolt); // a subclass of a target class
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", other), "of class 'Thing'", "[Part]");
        assertSame(aBolt, x.getValue("ref"));

        part.getInstances().remove(aPart);
        throwsWith(IllegalArgumentException.class, () -> x.setValue("ref", aPart), "is deleted");
    }
}
