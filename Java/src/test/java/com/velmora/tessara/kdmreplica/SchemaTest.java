package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.function.Executable;

/** Inheritance, schema checks, live collections, lookups and what schema changes do to existing instances. */
class SchemaTest {
    private static final Class<?> INDEX = IndexOutOfBoundsException.class;
    private static final Class<?> ARG = IllegalArgumentException.class;
    private static final Class<?> STATE = IllegalStateException.class;
    private Replica r;
    private Model part;
    private Model bolt;

    @BeforeEach
    void setUp() {
        r = replica("plant", "Part: name String, weight Double; Bolt(Part): thread Integer");
        part = r.getModels().getItem("Part");
        bolt = r.getModels().getItem("Bolt");
    }

    @Test
    void changingTheSuperClassRealignsInstancesAndRefusesUnknownCyclicOrClashingOnes() {
        addAttr(addClass(r, "Base", null), "uid", AttributeType.Integer, false);
        Instance b = inst(bolt, "thread", 6);
        ClassDef p = part.getClassDef();
        p.setSuperName("Base");
        assertEquals("uid", r.getAttributeDef("Bolt.uid").getAttributeName());
        assertEquals(6, b.getValue(3));
        b.setValue(0, 1);
        p.setSuperName(null);
        assertEquals("", p.getSuperName());
        assertEquals(6, b.getValue(2));
        addAttr(addClass(r, "Other", null), "thread", AttributeType.String, false);
        refusals(new Object[][] {
            {ARG, (Executable) () -> p.setSuperName("Nope"), "class 'Part'", "'Nope'"},
            {ARG, (Executable) () -> p.setSuperName("Bolt"), "cyclic", "Part -> Bolt -> Part"},
            {ARG, (Executable) () -> p.setSuperName("Part"), "cyclic"},
            {ARG, (Executable) () -> addAttr(bolt, "name", AttributeType.String, false), "'Bolt.name'", "'Part.name'"},
            {ARG, (Executable) () -> addAttr(part, "thread", AttributeType.Integer, false), "'Bolt.thread'"},
            {ARG, (Executable) () -> bolt.getClassDef().setSuperName("Other"), "'Bolt.thread'", "'Other.thread'"}});
        assertEquals("", p.getSuperName());
        assertEquals("Part", bolt.getClassDef().getSuperName());
        assertEquals(2, p.getAttributes().getCount());
        assertEquals(1, bolt.getClassDef().getAttributes().getCount());

        ClassDef orphan = new ClassDef("Orphan");
        orphan.setSuperName("Missing"); // only stored while in no replica
        throwsWith(IllegalArgumentException.class, () -> r.getModels().add(new Model(orphan)), "'Missing'");
        assertNull(orphan.replica);
        assertNull(r.getClassDef("Orphan"));
        orphan.setSuperName("Part");
        r.getModels().add(new Model(orphan));
        assertEquals(5, r.getModels().getCount());
    }

    @Test
    void aClassNameIsTakenOnceAndRenamesCarrySubclassesAndTargets() throws Exception {
        AttributeDef link = addAttr(part, "link", AttributeType.Relationship, false);
        link.setTargetNames(new String[] {"Nut", "Part"});
        Instance b = bolt.createInstance();
        b.setValue("link", b);
        part.getClassDef().setClassName("Item");
        assertEquals("Item", bolt.getClassDef().getSuperName());
        assertArrayEquals(new String[] {"Nut", "Item"}, link.getTargetNames());
        inst(part, "link", b);
        r.commit();
        for (RoundTripTest.Form f : RoundTripTest.Form.values()) {
            RoundTripTest.same(r, f);
        }
        assertSame(part, r.getModels().getItem("Item"));
        assertNull(r.getModels().getItem("Part"));
        refusals(new Object[][] {
            {ARG, (Executable) () -> r.getModels().add(new Model(new ClassDef("Item"))), "already has a class 'Item'"},
            {ARG, (Executable) () -> part.getClassDef().setClassName("Bolt"), "taken"},
            {ARG, (Executable) () -> r.getModels().remove("Item"), "'Bolt' extends it"},
            {ARG, (Executable) () -> new ClassDef("a.b"), "'a.b'"},
            {ARG, (Executable) () -> new AttributeDef("", AttributeType.Integer), "empty"},
            {ARG, (Executable) () -> new AttributeDef("x", null), "type is null"}});
    }

    @Test
    void attributesAreFoundByQualifiedOrUniqueBareNameAndBelongToOneClass() {
        addAttr(addClass(r, "Nut", null), "thread", AttributeType.Integer, false);
        assertSame(bolt.getClassDef().getAttributes().getItem(0), r.getAttributeDef("Bolt.thread"));
        assertSame(part.getClassDef().getAttributes().getItem(1), r.getAttributeDef("weight"));
        assertSame(r.getAttributeDef("Part.name"), r.getAttributeDef("Bolt.name")); // inherited: one definition
        throwsWith(IllegalArgumentException.class, () -> r.getAttributeDef("thread"), "ambiguous", "'Bolt'", "'Nut'");
        for (String absent : new String[] {"nothing", "Nope.name", "Part.thread"}) {
            assertNull(r.getAttributeDef(absent), absent);
        }
        assertNull(r.getClassDef("Nope"));
        assertThrows(IllegalArgumentException.class, () -> r.getAttributeDef(null));

        AttributeDef a = r.getAttributeDef("Part.name");
        assertSame(part.getClassDef(), a.getClassDef());
        ClassDef nut = r.getClassDef("Nut");
        throwsWith(IllegalArgumentException.class, () -> nut.getAttributes().add(a), "already belongs to class 'Part'");
        part.getClassDef().getAttributes().remove(a);
        assertNull(a.getClassDef());
        nut.getAttributes().add(a);
        assertEquals("AttributeDef 'Nut.name' String", a.toString());
    }

    @Test
    void editsThatStoredValuesWouldBreakAreRefusedAndChangeNothing() {
        AttributeDef link = addAttr(part, "link", AttributeType.Relationship, false);
        link.setTargetNames(new String[] {"Part"});
        AttributeDef blobs = addAttr(bolt, "blobs", AttributeType.Binary, true);
        Instance b = inst(bolt, "blobs", new byte[][] {{}, {1, 2, 3}}, "weight", 2.0);
        b.setValue("link", b); // dropped with Part.link when Bolt leaves Part: no obstacle to that
        inst(part, "link", b);
        Instance gone = inst(part, "name", "plate \ud83d\udd29");
        r.commit();
        part.getInstances().remove(gone); // deleted: written with the states until the next commit
        String before = dump(r);
        AttributeDef name = r.getAttributeDef("Part.name");
        refusals(new Object[][] {
            {STATE, (Executable) () -> link.setTargetNames(new String[] {"Nut"}), "'Part.link'", "Part[#0]", "Bolt[#0]",
                "class 'Bolt'"},
            {STATE, (Executable) () -> bolt.getClassDef().setSuperName(null), "class 'Bolt'", "'Part.link'", "Part[#0]"},
            {STATE, (Executable) () -> name.setLength(6), "'Part.name'", "Part[deleted]", "7 characters", " 6 "},
            {STATE, (Executable) () -> blobs.setLength(2), "'Bolt.blobs'", "Bolt[#0]", "3 bytes", " 2 "},
            {STATE, (Executable) () -> r.getAttributeDef("Part.weight").setMultiValuation(true), "'Part.weight'",
                "1 instance"}});
        assertEquals(before, dump(r));
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
        assertArrayEquals(new int[] {0, -1, 2, 2, 1, -1, -1, -1, -1}, new int[] {set.indexOf(x), set.indexOf(y),
            models.indexOf("Other"), models.indexOf(other.getClassDef()), attrs.indexOf(attrs.getItem("weight")),
            models.indexOf("Nope"), models.indexOf(new ClassDef("Part")), attrs.indexOf("b"),
            attrs.indexOf(new AttributeDef("name", AttributeType.String))});
        assertTrue(attrs.includes("name") && !models.includes("Nope"));
        assertNull(models.getItem("Nope"));
        assertNull(attrs.getItem("b"));
        String before = dump(r);
        refusals(new Object[][] {
            {INDEX, (Executable) () -> models.getItem(3), "replica 'plant'", "position 3"},
            {INDEX, (Executable) () -> models.remove(-1), "position -1"},
            {INDEX, (Executable) () -> attrs.getItem(2), "class 'Part'", "position 2"},
            {INDEX, (Executable) () -> attrs.remove(5), "position 5"},
            {INDEX, (Executable) () -> set.getItem(-1), "class 'Part'", "position -1"},
            {INDEX, (Executable) () -> set.remove(1), "position 1", "count 1"},
            {INDEX, (Executable) () -> x.getValue(2), "Part[#0]", "position 2"},
            {INDEX, (Executable) () -> x.setValue(-1, 3), "position -1"},
            {INDEX, (Executable) () -> x.isValuated(2), "position 2"},
            {INDEX, (Executable) () -> x.clearValue(2), "position 2"},
            {ARG, (Executable) () -> models.remove("Nope"), "'Nope'"},
            {ARG, (Executable) () -> models.remove(new ClassDef("Part")), "'Part'"},
            {ARG, (Executable) () -> attrs.remove("b"), "'b'"},
            {ARG, (Executable) () -> attrs.remove(new AttributeDef("name", AttributeType.String)), "'name'", "not in this list"},
            {ARG, (Executable) () -> set.remove(y), "Other[#0]", "not in this set"},
            {ARG, (Executable) () -> models.add(null), "model is null"},
            {ARG, (Executable) () -> models.add(part), "already in replica 'plant'"},
            {ARG, (Executable) () -> new Model(null), "null"}});
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
        Model m = new Model();
        new ModelSet().add(m);
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
