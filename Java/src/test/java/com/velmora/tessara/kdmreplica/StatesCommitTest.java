package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.charset.StandardCharsets;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;

/** States, removal with composition, identifiers, and the all-or-nothing commit. */
class StatesCommitTest {
    private Replica r;
    private Model car;
    private Model wheel;
    private Model person;

    @BeforeEach
    void setUp() {
        r = new Replica("garage");
        person = addClass(r, "Person", null);
        addAttr(person, "name", AttributeType.String, false);
        wheel = addClass(r, "Wheel", null);
        addAttr(wheel, "size", AttributeType.Integer, false);
        car = addClass(r, "Car", null);
        addAttr(car, "wheels", AttributeType.Relationship, true).setAggregationType(AggregationType.Composition);
        addAttr(car, "owner", AttributeType.Relationship, false);
    }

    private static String states(Instance x) {
        return (x.isCreated() ? "C" : "") + (x.isModified() ? "M" : "") + (x.isDeleted() ? "D" : "");
    }

    @Test
    void stateLifecycle() {
        Instance p = person.createInstance();
        assertEquals("C", states(p));
        p.setValue("name", "Ann");
        assertEquals("C", states(p));
        r.commit();
        assertEquals("", states(p));
        p.setID("ann");
        assertEquals("M", states(p));
        r.commit();
        p.clearValue("name");
        assertEquals("M", states(p));
        person.getInstances().remove(p);
        assertEquals("D", states(p));
        assertEquals(0, person.getInstances().getCount());
        assertTrue(r.toString().contains("1 deleted"), r.toString());
        throwsWith(IllegalStateException.class, () -> p.setValue("name", "x"), "Person[id=\"ann\"]", "deleted");
        throwsWith(IllegalStateException.class, () -> p.setID("x"), "deleted");
        assertEquals("ann", p.getID()); // still readable
        r.commit();
        assertEquals("Replica 'garage' (3 classes, 0 instances)", r.toString());
        assertTrue(p.isDeleted());
        Instance never = person.createInstance(); // never committed: simply disappears
        person.getInstances().remove(0);
        assertEquals("D", states(never));
        assertEquals("Replica 'garage' (3 classes, 0 instances)", r.toString());
    }

    @Test
    void removalCascadesThroughCompositionOnly() {
        Instance c = car.createInstance();
        Instance w1 = wheel.createInstance();
        Instance w2 = wheel.createInstance();
        Instance keep = wheel.createInstance();
        Instance owner = person.createInstance();
        c.setValue("wheels", new Instance[] {w1, w2});
        c.setValue("owner", owner);
        r.commit();
        car.getInstances().remove(c);
        assertTrue(c.isDeleted() && w1.isDeleted() && w2.isDeleted());
        assertFalse(owner.isDeleted() || keep.isDeleted());
        assertSame(keep, wheel.getInstances().getItem(0));
        assertEquals(0, wheel.getInstances().indexOf(keep));
        assertEquals(-1, wheel.getInstances().indexOf(w1));

        // a composition cycle ends
        Instance a = car.createInstance();
        Instance b = car.createInstance();
        AttributeDef self = addAttr(car, "spare", AttributeType.Relationship, false);
        self.setAggregationType(AggregationType.Composition);
        a.setValue("spare", b);
        b.setValue("spare", a);
        car.getInstances().removeAll();
        assertEquals(0, car.getInstances().getCount());
        assertTrue(a.isDeleted() && b.isDeleted());

        // removing a model deletes its instances and leaves references to them dangling
        Instance owned = car.createInstance();
        Instance ann = person.createInstance();
        owned.setValue("owner", ann);
        r.commit();
        r.getModels().remove("Person");
        assertTrue(ann.isDeleted());
        throwsWith(ReplicaCommitException.class, r::commit, "'Car.owner'", "which is deleted");
        owned.clearValue("owner");
        r.commit();
    }

    @Test
    void commitListsEveryViolationAndChangesNothing() {
        r.getAttributeDef("Person.name").setMandatory(true);
        AttributeDef size = r.getAttributeDef("size");
        size.setUnicity(true);
        Model sub = addClass(r, "BigWheel", "Wheel");
        car.getClassDef().setAbstract(true);

        Instance nameless = person.createInstance();
        Instance w1 = wheel.createInstance();
        Instance w2 = sub.createInstance(); // uniqueness spans the subclass
        w1.setValue("size", 17);
        w2.setValue("size", 17);
        Instance goner = person.createInstance();
        goner.setValue("name", "Bob");
        AttributeDef tags = addAttr(person, "tags", AttributeType.Binary, true);
        tags.setUnicity(true); // arrays are compared by content
        nameless.setValue("tags", new byte[][] {{1, 2}, {3}});
        goner.setValue("tags", new byte[][] {{1, 2}, {3}});
        Instance other = person.createInstance();
        other.setValue("name", "Cy");
        other.setValue("tags", new byte[][] {{1, 2}, {3}});
        Instance c = car.createInstance();
        c.setValue("owner", goner);
        r.getModels().getItem("Person").getInstances().remove(goner);

        ReplicaCommitException e = throwsWith(ReplicaCommitException.class, r::commit,
                "replica 'garage'", "5 violations",
                "Person[#0]: mandatory attribute 'Person.name' has no value",
                "attribute 'Wheel.size' is unique but Wheel[#0] and BigWheel[#0] both hold 17",
                "class 'Car' is abstract",
                "Car[#0]: attribute 'Car.owner' refers to Person[deleted], which is deleted",
                "attribute 'Person.tags' is unique but Person[#0] and Person[#1] both hold");
        assertEquals(5, e.getViolationCount());
        assertEquals(5, e.getViolations().size());
        assertEquals("C", states(nameless));
        assertEquals("C", states(c));
        assertTrue(goner.isDeleted());

        nameless.setValue("name", "Ann");
        other.setValue("tags", new byte[][] {{1, 2}, {4}});
        w2.setValue("size", 18);
        c.clearValue("owner");
        car.getClassDef().setAbstract(false);
        r.commit();
        assertEquals("", states(nameless) + states(c) + states(w2));
    }

    @Test
    void violationsAreListedUpToALimit() {
        r.getAttributeDef("name").setMandatory(true);
        for (int i = 0; i < 150; i++) {
            person.createInstance();
        }
        ReplicaCommitException e = throwsWith(ReplicaCommitException.class, r::commit, "150 violations",
                "and 50 more");
        assertEquals(Replica.MAX_LISTED_VIOLATIONS, e.getViolations().size());
        assertEquals(150, e.getViolationCount());
    }

    @Test
    void identifiersAreUniqueAmongLiveInstancesOfAModel() {
        Instance a = person.createInstance();
        Instance b = person.createInstance();
        a.setID("x");
        throwsWith(IllegalArgumentException.class, () -> b.setID("x"), "class 'Person'", "\"x\"");
        b.setID("x".getBytes(StandardCharsets.UTF_8)); // a byte identifier is another kind
        throwsWith(IllegalArgumentException.class, () -> a.setID(new byte[] {'x'}), "0x78");
        wheel.createInstance().setID("x"); // another model
        throwsWith(IllegalArgumentException.class, () -> b.setID(7), "String or a byte[]", "java.lang.Integer");

        byte[] id = (byte[]) b.getID();
        id[0] = 'y';
        assertArrayEquals(new byte[] {'x'}, (byte[]) b.getID());
        a.setID(null);
        b.setID("x"); // freed by a
        person.getInstances().remove(b);
        a.setID("x"); // freed by the removal
        assertEquals("x", b.getID());
    }
}
