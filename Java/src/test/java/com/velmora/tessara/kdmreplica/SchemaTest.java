package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static com.velmora.tessara.kdmreplica.Fx.dump;
import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.Arrays;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.function.Executable;

/** Inheritance, schema checks, live collections, lookups and what schema changes do to existing instances. */
class SchemaTest {
    private Replica r;
    private Model part;
    private Model bolt;

    @BeforeEach
    void setUp() {
        r = new Replica("plant");
        part = addClass(r, "Part", null);
        addAttr(part, "name", AttributeType.String, false);
        addAttr(part, "weight", AttributeType.Double, false);
        bolt = addClass(r, "Bolt", "Part");
        addAttr(bolt, "thread", AttributeType.Integer, false);
    }

    @Test
    void subclassInstancesHaveInheritedAttributesFirst() {
        Instance b = bolt.createInstance();
        b.setValue(0, "m8");
        b.setValue(1, 2.5);
        b.setValue(2, 8);
        assertEquals("m8", b.getValue("name"));
        assertEquals(8, b.getValue("thread"));
        throwsWith(IndexOutOfBoundsException.class, () -> b.getValue(3), "position 3", "3 attributes");
        throwsWith(IllegalArgumentException.class, () -> b.getValue("wieght"), "class 'Bolt'", "'wieght'");
        assertSame(part.getClassDef().getAttributes().getItem("name"), r.getAttributeDef("Bolt.name"));
    }

    @Test
    void valuesFollowTheirAttributesWhenTheSchemaChanges() {
        Instance p = part.createInstance();
        Instance b = bolt.createInstance();
        p.setValue("name", "plate");
        p.setValue("weight", 1.0);
        b.setValue("name", "m8");
        b.setValue("thread", 8);

        // a new attribute of the super class goes before the subclass's own, without value
        addAttr(part, "colour", AttributeType.String, false);
        assertEquals("colour", part.getClassDef().getAttributes().getItem(2).getAttributeName());
        assertFalse(b.isValuated("colour"));
        assertEquals(3, r.getClassDef("Bolt").getAttributes().getCount() + 2);
        assertEquals(8, b.getValue(3));
        assertEquals("m8", b.getValue(0));
        b.setValue("colour", "red");

        // removing one takes its values with it, the others stay
        part.getClassDef().getAttributes().remove("weight");
        assertEquals("plate", p.getValue("name"));
        assertEquals("red", b.getValue(1));
        assertEquals(8, b.getValue("thread"));
        throwsWith(IllegalArgumentException.class, () -> p.getValue("weight"), "'weight'");
        assertNull(r.getAttributeDef("Part.weight"));
    }

    @Test
    void forgottenDeletedInstancesKeepTheAttributesTheyLeftWith() {
        Instance fresh = part.createInstance();
        fresh.setValue("weight", 3.0);
        Instance committed = part.createInstance();
        committed.setValue("weight", 4.0);
        r.commit();
        part.getInstances().remove(committed);
        r.commit(); // forgotten now
        Instance neverCommitted = part.createInstance();
        neverCommitted.setValue("weight", 5.0);
        part.getInstances().remove(neverCommitted);
        part.getInstances().remove(fresh);
        r.commit();

        part.getClassDef().getAttributes().remove("name");
        addAttr(part, "colour", AttributeType.String, false);
        assertEquals(4.0, committed.getValue("weight"));
        assertEquals(5.0, neverCommitted.getValue(1));
        throwsWith(IllegalArgumentException.class, () -> neverCommitted.getValue("colour"), "'colour'");
        assertEquals("Instance Part[deleted] deleted {weight=5.0}", neverCommitted.toString(true));
    }

    @Test
    void changingTheSuperClassRealignsInstances() {
        Model base = addClass(r, "Base", null);
        addAttr(base, "uid", AttributeType.Integer, false);
        Instance b = bolt.createInstance();
        b.setValue("thread", 6);
        part.getClassDef().setSuperName("Base");
        assertEquals("uid", r.getAttributeDef("Bolt.uid").getAttributeName());
        assertEquals(6, b.getValue(3));
        b.setValue(0, 1);
        part.getClassDef().setSuperName(null);
        assertEquals("", part.getClassDef().getSuperName());
        assertEquals(6, b.getValue(2));
    }

    @Test
    void unknownAndCyclicSuperClassesAreRefusedAndUndone() {
        ClassDef p = part.getClassDef();
        throwsWith(IllegalArgumentException.class, () -> p.setSuperName("Nope"), "class 'Part'", "'Nope'");
        assertEquals("", p.getSuperName());
        throwsWith(IllegalArgumentException.class, () -> p.setSuperName("Bolt"), "cyclic", "Part -> Bolt -> Part");
        throwsWith(IllegalArgumentException.class, () -> p.setSuperName("Part"), "cyclic");
        assertEquals("", p.getSuperName());

        ClassDef orphan = new ClassDef("Orphan");
        orphan.setSuperName("Missing"); // only stored while in no replica
        throwsWith(IllegalArgumentException.class, () -> r.getModels().add(new Model(orphan)), "'Missing'");
        assertEquals(2, r.getModels().getCount());
        assertNull(orphan.replica);
        assertNull(r.getClassDef("Orphan"));
        orphan.setSuperName("Part");
        r.getModels().add(new Model(orphan));
        assertEquals(3, r.getModels().getCount());
    }

    @Test
    void attributeNamesMayNotClashAlongTheInheritanceChain() {
        throwsWith(IllegalArgumentException.class, () -> addAttr(bolt, "name", AttributeType.String, false),
                "'Bolt.name'", "'Part.name'");
        throwsWith(IllegalArgumentException.class, () -> addAttr(part, "thread", AttributeType.Integer, false),
                "'Bolt.thread'");
        assertEquals(2, part.getClassDef().getAttributes().getCount());
        assertEquals(1, bolt.getClassDef().getAttributes().getCount());
        Model other = addClass(r, "Other", null);
        addAttr(other, "thread", AttributeType.String, false);
        throwsWith(IllegalArgumentException.class, () -> bolt.getClassDef().setSuperName("Other"), "'Bolt.thread'", "'Other.thread'");
        assertEquals("Part", bolt.getClassDef().getSuperName());
    }

    @Test
    void aClassNameIsTakenOnceAndRenamesCarrySubclassesAndTargets() throws Exception {
        throwsWith(IllegalArgumentException.class, () -> r.getModels().add(new Model(new ClassDef("Part"))),
                "already has a class 'Part'");
        throwsWith(IllegalArgumentException.class, () -> part.getClassDef().setClassName("Bolt"), "taken");
        AttributeDef link = addAttr(part, "link", AttributeType.Relationship, false);
        link.setTargetNames(new String[] {"Nut", "Part"});
        Instance b = bolt.createInstance();
        b.setValue("link", b);
        part.getClassDef().setClassName("Item");
        assertEquals("Item", bolt.getClassDef().getSuperName());
        assertArrayEquals(new String[] {"Nut", "Item"}, link.getTargetNames());
        part.createInstance().setValue("link", b);
        r.commit();
        for (RoundTripTest.Form f : RoundTripTest.Form.values()) {
            RoundTripTest.same(r, f);
        }
        assertSame(part, r.getModels().getItem("Item"));
        assertNull(r.getModels().getItem("Part"));
        throwsWith(IllegalArgumentException.class, () -> r.getModels().remove("Item"), "'Bolt' extends it");
        throwsWith(IllegalArgumentException.class, () -> new ClassDef("a.b"), "'a.b'");
        throwsWith(IllegalArgumentException.class, () -> new AttributeDef("", AttributeType.Integer), "empty");
        throwsWith(IllegalArgumentException.class, () -> new AttributeDef("x", null), "type is null");
    }

    @Test
    void attributeLookupByQualifiedOrUniqueBareName() {
        Model nut = addClass(r, "Nut", null);
        addAttr(nut, "thread", AttributeType.Integer, false);
        assertSame(bolt.getClassDef().getAttributes().getItem(0), r.getAttributeDef("Bolt.thread"));
        assertSame(part.getClassDef().getAttributes().getItem(1), r.getAttributeDef("weight"));
        throwsWith(IllegalArgumentException.class, () -> r.getAttributeDef("thread"), "ambiguous", "'Bolt'", "'Nut'");
        assertNull(r.getAttributeDef("nothing"));
        assertNull(r.getAttributeDef("Nope.name"));
        assertNull(r.getAttributeDef("Part.thread"));
        assertNull(r.getClassDef("Nope"));
        assertThrows(IllegalArgumentException.class, () -> r.getAttributeDef(null));
    }

    @Test
    void anAttributeBelongsToOneClass() {
        AttributeDef a = part.getClassDef().getAttributes().getItem("name");
        assertSame(part.getClassDef(), a.getClassDef());
        Model nut = addClass(r, "Nut", null);
        throwsWith(IllegalArgumentException.class, () -> nut.getClassDef().getAttributes().add(a),
                "already belongs to class 'Part'");
        part.getClassDef().getAttributes().remove(a);
        assertNull(a.getClassDef());
        nut.getClassDef().getAttributes().add(a);
        assertSame(nut.getClassDef(), a.getClassDef());
        assertEquals("AttributeDef 'Nut.name' String", a.toString());
    }

    @Test
    void editsThatStoredValuesWouldBreakAreRefusedAndChangeNothing() {
        AttributeDef link = addAttr(part, "link", AttributeType.Relationship, false);
        link.setTargetNames(new String[] {"Part"});
        AttributeDef blobs = addAttr(bolt, "blobs", AttributeType.Binary, true);
        Instance b = bolt.createInstance();
        b.setValue("blobs", new byte[][] {{}, {1, 2, 3}});
        b.setValue("link", b); // dropped with Part.link when Bolt leaves Part: no obstacle to that
        b.setValue("weight", 2.0);
        part.createInstance().setValue("link", b);
        Instance gone = part.createInstance();
        gone.setValue("name", "plate \ud83d\udd29");
        r.commit();
        part.getInstances().remove(gone); // deleted: written with the states until the next commit
        String before = dump(r);
        AttributeDef name = r.getAttributeDef("Part.name");
        Object[][] edits = {
            {(Executable) () -> link.setTargetNames(new String[] {"Nut"}), "'Part.link'", "Part[#0]", "Bolt[#0]",
                "class 'Bolt'"},
            {(Executable) () -> bolt.getClassDef().setSuperName(null), "class 'Bolt'", "'Part.link'", "Part[#0]"},
            {(Executable) () -> name.setLength(6), "'Part.name'", "Part[deleted]", "7 characters", " 6 "},
            {(Executable) () -> blobs.setLength(2), "'Bolt.blobs'", "Bolt[#0]", "3 bytes", " 2 "},
            {(Executable) () -> r.getAttributeDef("Part.weight").setMultiValuation(true), "'Part.weight'", "1 instance"},
        };
        for (Object[] e : edits) {
            throwsWith(IllegalStateException.class, (Executable) e[0], Arrays.copyOfRange(e, 1, e.length, String[].class));
            assertEquals(before, dump(r));
        }
        name.setLength(7);
        blobs.setLength(3);
        part.getInstances().getItem(0).clearValue("link");
        bolt.getClassDef().setSuperName(null);
        link.setTargetNames(new String[] {"Nut"});
    }

    @Test
    void positionsAreZeroBasedAbsentItemsAnswerNullOrMinusOneAndBadCallsChangeNothing() {
        Instance x = part.createInstance();
        Model other = addClass(r, "Other", null);
        Instance y = other.createInstance();
        ModelSet models = r.getModels();
        AttributeDefList attrs = part.getClassDef().getAttributes();
        InstanceSet set = part.getInstances();
        assertSame(part, models.getItem(0));
        assertSame(x, set.getItem(0));
        assertEquals(0, set.indexOf(x));
        assertEquals(-1, set.indexOf(y));
        assertEquals(2, models.indexOf("Other"));
        assertEquals(2, models.indexOf(other.getClassDef()));
        assertEquals(1, attrs.indexOf(attrs.getItem("weight")));
        assertTrue(attrs.includes("name"));
        assertNull(models.getItem("Nope"));
        assertEquals(-1, models.indexOf("Nope"));
        assertEquals(-1, models.indexOf(new ClassDef("Part")));
        assertFalse(models.includes("Nope"));
        assertNull(attrs.getItem("b"));
        assertEquals(-1, attrs.indexOf("b"));
        assertEquals(-1, attrs.indexOf(new AttributeDef("name", AttributeType.String)));
        Class<?> index = IndexOutOfBoundsException.class;
        Class<?> arg = IllegalArgumentException.class;
        Object[][] refusals = {
            {index, (Executable) () -> models.getItem(3), "replica 'plant'", "position 3"},
            {index, (Executable) () -> models.remove(-1), "position -1"},
            {index, (Executable) () -> attrs.getItem(2), "class 'Part'", "position 2"},
            {index, (Executable) () -> attrs.remove(5), "position 5"},
            {index, (Executable) () -> set.getItem(-1), "class 'Part'", "position -1"},
            {index, (Executable) () -> set.remove(1), "position 1", "count 1"},
            {index, (Executable) () -> x.getValue(2), "Part[#0]", "position 2"},
            {index, (Executable) () -> x.setValue(-1, 3), "position -1"},
            {index, (Executable) () -> x.isValuated(2), "position 2"},
            {index, (Executable) () -> x.clearValue(2), "position 2"},
            {arg, (Executable) () -> models.remove("Nope"), "'Nope'"},
            {arg, (Executable) () -> models.remove(new ClassDef("Part")), "'Part'"},
            {arg, (Executable) () -> attrs.remove("b"), "'b'"},
            {arg, (Executable) () -> attrs.remove(new AttributeDef("name", AttributeType.String)), "'name'",
                "not in this list"},
            {arg, (Executable) () -> set.remove(y), "Other[#0]", "not in this set"},
            {arg, (Executable) () -> models.add(null), "model is null"},
            {arg, (Executable) () -> models.add(part), "already in replica 'plant'"},
            {arg, (Executable) () -> new Model(null), "null"},
        };
        String before = dump(r);
        for (Object[] row : refusals) {
            throwsWith(((Class<?>) row[0]).asSubclass(Throwable.class), (Executable) row[1],
                    Arrays.copyOfRange(row, 2, row.length, String[].class));
        }
        assertEquals(before, dump(r));
    }

    @Test
    void aRemovedModelLeavesWithItsInstancesAndMayJoinAgain() {
        part.createInstance();
        bolt.getClassDef().setSuperName(null);
        r.getModels().remove(part.getClassDef());
        assertNull(r.getClassDef("Part"));
        assertNull(part.getReplica());
        assertEquals(0, part.getInstances().getCount());
        r.getModels().add(part);
        assertEquals(2, part.createInstance().getClassDef().getAttributes().getCount());
    }

    @Test
    void noArgumentConstructorsGiveUsableObjects() {
        ModelSet ms = new ModelSet();
        Model m = new Model();
        ms.add(m);
        assertTrue(m.getReplica().getName().startsWith("Replica"));
        m.getClassDef().getAttributes().add(new AttributeDef());
        m.createInstance().setValue(0, "a generated attribute is a String");
        AttributeDefList list = new AttributeDefList();
        list.add(new AttributeDef("a", AttributeType.Boolean));
        assertTrue(list.getItem(0).getClassDef().getClassName().startsWith("Class"));
        new InstanceSet().removeAll();
        Instance detached = new Instance();
        assertNull(detached.getClassDef());
        detached.setID("free");
        assertEquals("free", detached.getID());
        throwsWith(IllegalArgumentException.class, () -> detached.getValue("x"), "'x'");
        throwsWith(IllegalStateException.class, () -> new Model().createInstance(), "in no replica");
        assertTrue(new Replica().getName().startsWith("Replica"));
    }
}
