package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import java.nio.charset.StandardCharsets;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;

/** States, removal with composition, identifiers, the all-or-nothing commit, and the staging that readers use. */
class StatesCommitTest {
    private Replica r;
    private Model car;
    private Model wheel;
    private Model person;

    @BeforeEach
    void setUp() {
        r = replica("garage", "Person: name String; Wheel: size Integer; Car: wheels Relationship*, owner Relationship");
        person = r.getModels().getItem("Person");
        wheel = r.getModels().getItem("Wheel");
        car = r.getModels().getItem("Car");
        r.getAttributeDef("Car.wheels").setAggregationType(AggregationType.Composition);
    }

    private static String states(Instance... xs) {
        StringBuilder b = new StringBuilder();
        for (Instance x : xs) {
            b.append(x.isCreated() ? "C" : "").append(x.isModified() ? "M" : "").append(x.isDeleted() ? "D" : "").append(',');
        }
        return b.toString();
    }

    @Test
    void stateLifecycle() {
        Instance p = inst(person, "name", "Ann");
        assertEquals("C,", states(p));
        r.commit();
        assertEquals(",", states(p));
        p.setID("ann");
        assertEquals("M,", states(p));
        r.commit();
        assertEquals(",", states(p));
        p.clearValue("name");
        assertEquals("M,", states(p));
        person.getInstances().remove(p);
        assertEquals("D,", states(p));
        assertEquals("Instance Person[id=\"ann\"] deleted", p.toString());
        assertEquals("Replica 'garage' (3 classes, 0 instances, 1 deleted)", r.toString());
        throwsWith(IllegalStateException.class, () -> p.setValue("name", "x"), "Person[id=\"ann\"]", "deleted");
        throwsWith(IllegalStateException.class, () -> p.setID("x"), "deleted");
        assertEquals("ann", p.getID()); // still readable
        r.commit();
        assertEquals("Replica 'garage' (3 classes, 0 instances)", r.toString());
        assertEquals("D,", states(p));
        Instance never = person.createInstance(); // never committed: simply disappears
        person.getInstances().remove(0);
        assertEquals("D,", states(never));
        assertEquals("Replica 'garage' (3 classes, 0 instances)", r.toString());
    }

    @Test
    void removalCascadesThroughCompositionOnly() {
        Instance w1 = wheel.createInstance();
        Instance w2 = wheel.createInstance();
        Instance keep = wheel.createInstance();
        Instance owner = person.createInstance();
        Instance c = inst(car, "wheels", new Instance[] {w1, w2}, "owner", owner);
        r.commit();
        car.getInstances().remove(c);
        assertEquals("D,D,D,,,", states(c, w1, w2, owner, keep));
        assertSame(keep, wheel.getInstances().getItem(0));
        assertEquals(-1, wheel.getInstances().indexOf(w1));
        // a composition cycle ends
        addAttr(car, "spare", AttributeType.Relationship, false).setAggregationType(AggregationType.Composition);
        Instance a = car.createInstance();
        Instance b = inst(car, "spare", a);
        a.setValue("spare", b);
        car.getInstances().removeAll();
        assertEquals(0, car.getInstances().getCount());
        assertEquals("D,D,", states(a, b));
        // removing a model deletes its instances and leaves references to them dangling
        Instance ann = person.createInstance();
        Instance owned = inst(car, "owner", ann);
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
        r.getAttributeDef("size").setUnicity(true);
        Model sub = addClass(r, "BigWheel", "Wheel");
        car.getClassDef().setAbstract(true);
        addAttr(person, "tags", AttributeType.Binary, true).setUnicity(true); // arrays are compared by content
        Instance nameless = inst(person, "tags", new byte[][] {{1, 2}, {3}});
        inst(wheel, "size", 17);
        Instance w2 = inst(sub, "size", 17); // uniqueness spans the subclass
        Instance goner = inst(person, "name", "Bob", "tags", new byte[][] {{1, 2}, {3}});
        Instance other = inst(person, "name", "Cy", "tags", new byte[][] {{1, 2}, {3}});
        Instance c = inst(car, "owner", goner);
        person.getInstances().remove(goner);

        ReplicaCommitException e = throwsWith(ReplicaCommitException.class, r::commit, "replica 'garage'",
                "5 violations", "Person[#0]: mandatory attribute 'Person.name' has no value",
                "attribute 'Wheel.size' is unique but Wheel[#0] and BigWheel[#0] both hold 17", "class 'Car' is abstract",
                "Car[#0]: attribute 'Car.owner' refers to Person[deleted], which is deleted",
                "attribute 'Person.tags' is unique but Person[#0] and Person[#1] both hold");
        assertEquals(5, e.getViolationCount());
        assertEquals(5, e.getViolations().size());
        assertEquals("C,C,D,", states(nameless, c, goner));

        nameless.setValue("name", "Ann");
        other.setValue("tags", new byte[][] {{1, 2}, {4}});
        w2.setValue("size", 18);
        c.clearValue("owner");
        car.getClassDef().setAbstract(false);
        r.commit();
        assertEquals(",,,", states(nameless, c, w2));
    }

    @Test
    void violationsAreListedUpToALimit() {
        r.getAttributeDef("name").setMandatory(true);
        for (int i = 0; i < 150; i++) {
            person.createInstance();
        }
        ReplicaCommitException e = throwsWith(ReplicaCommitException.class, r::commit, "150 violations", "and 50 more");
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
        ((byte[]) b.getID())[0] = 'y';
        assertArrayEquals(new byte[] {'x'}, (byte[]) b.getID());
        a.setID(null);
        b.setID("x"); // freed by a
        person.getInstances().remove(b);
        a.setID("x"); // freed by the removal
        assertEquals("x", b.getID());
    }

    /** Values set while staging are checked as setValue checks them; what is not finished is undone. */
    @Test
    void stagedValuesAreCheckedAndUndoneUnlessFinished() {
        String before = dump(r);
        try (Staging st = new Staging(r)) {
            st.schemaDone();
            Instance w = st.newInstance(wheel, "w1", true, false, false);
            st.setValue(w, 0, 17);
            throwsWith(IllegalArgumentException.class, () -> st.setValue(w, 0, "not an integer"), "takes Integer");
        }
        assertEquals(before, dump(r));
    }
}
