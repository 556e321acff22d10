package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertTrue;

import org.junit.jupiter.api.Test;

/** Live collections, 0-based positions, not-found answers and the no-argument constructors. */
class CollectionsTest {

    @Test
    void collectionsAreTheOwnersOwn() {
        Replica r = new Replica("live");
        assertSame(r.getModels(), r.getModels());
        ClassDef c = new ClassDef("Part");
        Model m = new Model(c);
        r.getModels().add(m);
        assertSame(c, r.getClassDef("Part"));
        assertSame(c.getAttributes(), c.getAttributes());
        c.getAttributes().add(new AttributeDef("name", AttributeType.String));
        assertEquals("name", r.getAttributeDef("name").getAttributeName());
        Instance x = m.createInstance();
        assertSame(m.getInstances(), m.getInstances());
        assertSame(x, m.getInstances().getItem(0));
        assertTrue(x.isValuated("name") == false);
        r.getModels().remove(c);
        assertNull(r.getClassDef("Part"));
        assertNull(m.getReplica());
        assertEquals(0, m.getInstances().getCount());
        // the class keeps its own attributes and may join again
        r.getModels().add(m);
        assertEquals(1, m.createInstance().getClassDef().getAttributes().getCount());
    }

    @Test
    void positionsAreZeroBasedAndCheckedEverywhere() {
        Replica r = new Replica("pos");
        Model m = addClass(r, "Part", null);
        addAttr(m, "a", AttributeType.Integer, false);
        Instance x = m.createInstance();
        AttributeDefList attrs = m.getClassDef().getAttributes();
        ModelSet models = r.getModels();
        InstanceSet set = m.getInstances();

        assertSame(m, models.getItem(0));
        assertSame(x, set.getItem(0));
        assertEquals("a", attrs.getItem(0).getAttributeName());
        throwsWith(IndexOutOfBoundsException.class, () -> models.getItem(1), "replica 'pos'", "position 1");
        throwsWith(IndexOutOfBoundsException.class, () -> models.remove(-1), "position -1");
        throwsWith(IndexOutOfBoundsException.class, () -> attrs.getItem(1), "class 'Part'", "position 1");
        throwsWith(IndexOutOfBoundsException.class, () -> attrs.remove(5), "position 5");
        throwsWith(IndexOutOfBoundsException.class, () -> set.getItem(-1), "class 'Part'", "position -1");
        throwsWith(IndexOutOfBoundsException.class, () -> set.remove(1), "position 1", "count 1");
        throwsWith(IndexOutOfBoundsException.class, () -> x.getValue(1), "Part[#0]", "position 1");
        throwsWith(IndexOutOfBoundsException.class, () -> x.setValue(-1, 3), "position -1");
        throwsWith(IndexOutOfBoundsException.class, () -> x.isValuated(1), "position 1");
        throwsWith(IndexOutOfBoundsException.class, () -> x.clearValue(2), "position 2");
        assertEquals(1, set.getCount());
        assertEquals(1, attrs.getCount());
    }

    @Test
    void absentItemsAnswerNullOrMinusOneAndRemovalsOfThemThrow() {
        Replica r = new Replica("absent");
        Model m = addClass(r, "Part", null);
        AttributeDef a = addAttr(m, "a", AttributeType.Integer, false);
        AttributeDefList attrs = m.getClassDef().getAttributes();
        ModelSet models = r.getModels();
        Instance x = m.createInstance();
        Model other = addClass(r, "Other", null);
        Instance y = other.createInstance();

        assertNull(models.getItem("Nope"));
        assertEquals(-1, models.indexOf("Nope"));
        assertEquals(-1, models.indexOf(new ClassDef("Part")));
        assertFalse(models.includes("Nope"));
        assertEquals(1, models.indexOf("Other"));
        assertEquals(1, models.indexOf(other.getClassDef()));
        assertNull(attrs.getItem("b"));
        assertEquals(-1, attrs.indexOf("b"));
        assertEquals(-1, attrs.indexOf(new AttributeDef("a", AttributeType.Integer)));
        assertEquals(0, attrs.indexOf(a));
        assertTrue(attrs.includes("a"));
        assertEquals(-1, m.getInstances().indexOf(y));
        assertEquals(0, m.getInstances().indexOf(x));

        throwsWith(IllegalArgumentException.class, () -> models.remove("Nope"), "'Nope'");
        throwsWith(IllegalArgumentException.class, () -> models.remove(new ClassDef("Part")), "'Part'");
        throwsWith(IllegalArgumentException.class, () -> attrs.remove("b"), "'b'");
        throwsWith(IllegalArgumentException.class, () -> attrs.remove(new AttributeDef("a", AttributeType.Integer)),
                "'a'", "not in this list");
        throwsWith(IllegalArgumentException.class, () -> m.getInstances().remove(y), "Other[#0]", "not in this set");
        throwsWith(IllegalArgumentException.class, () -> models.add(null), "model is null");
        throwsWith(IllegalArgumentException.class, () -> models.add(m), "already in replica 'absent'");
        throwsWith(IllegalArgumentException.class, () -> new Model(null), "null");
        assertEquals(2, models.getCount());
    }

    @Test
    void noArgumentConstructorsGiveUsableObjects() {
        ModelSet ms = new ModelSet();
        Model m = new Model();
        ms.add(m);
        assertEquals(1, ms.getCount());
        assertTrue(m.getReplica().getName().startsWith("Replica"));
        m.getClassDef().getAttributes().add(new AttributeDef());
        Instance x = m.createInstance();
        x.setValue(0, "a generated attribute is a String");

        AttributeDefList list = new AttributeDefList();
        list.add(new AttributeDef("a", AttributeType.Boolean));
        assertEquals("a", list.getItem(0).getAttributeName());
        assertTrue(list.getItem(0).getClassDef().getClassName().startsWith("Class"));

        InstanceSet set = new InstanceSet();
        assertEquals(0, set.getCount());
        set.removeAll();

        Instance detached = new Instance();
        assertNull(detached.getClassDef());
        detached.setID("free");
        assertEquals("free", detached.getID());
        throwsWith(IllegalArgumentException.class, () -> detached.getValue("x"), "'x'");
        throwsWith(IllegalStateException.class, () -> new Model().createInstance(), "in no replica");
        assertTrue(new Replica().getName().startsWith("Replica"));
        assertEquals(AttributeType.String, new AttributeDef().getAttributeType());
    }
}
