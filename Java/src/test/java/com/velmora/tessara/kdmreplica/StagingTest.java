package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.util.Date;
import org.junit.jupiter.api.Test;

/** The all-or-nothing builder that document readers use. */
class StagingTest {

    private static ClassDef classDef(String name, String superName, String attr, AttributeType type) {
        ClassDef c = new ClassDef(name);
        c.setSuperName(superName);
        if (attr != null) {
            c.getAttributes().add(new AttributeDef(attr, type));
        }
        return c;
    }

    @Test
    void buildsClassesInAnyOrderAndKeepsStates() {
        Replica r = new Replica("built");
        Instance bolt;
        try (Staging st = new Staging(r)) {
            Model b = st.addClass(classDef("Bolt", "Part", "thread", AttributeType.Integer));
            Model p = st.addClass(classDef("Part", null, "made", AttributeType.Date));
            p.classDef.attributes.items.get(0).accessMode = AccessMode.Read; // documents still fill it
            st.schemaDone();
            bolt = st.newInstance(b, "b1", false, true, false);
            st.setValue(bolt, 0, new Date(1000));
            st.setValue(bolt, 1, 8);
            Instance gone = st.newInstance(p, "b1", false, false, true);
            assertTrue(gone.isDeleted());
            st.finish();
        }
        assertEquals(8, bolt.getValue("thread"));
        assertEquals(new Date(1000), bolt.getValue("made"));
        assertTrue(bolt.isModified());
        assertEquals("Replica 'built' (2 classes, 1 instances, 1 deleted)", r.toString());
    }

    @Test
    void anythingNotFinishedIsUndone() {
        Replica r = new Replica("target");
        Model part = addClass(r, "Part", null);
        addAttr(part, "n", AttributeType.Integer, false);
        Instance old = part.createInstance();
        old.setID("p1");
        String before = r.toString();

        try (Staging st = new Staging(r)) {
            Model nut = st.addClass(classDef("Nut", "Part", null, null));
            st.schemaDone();
            st.newInstance(nut, "n1", true, false, false);
            st.newInstance(part, "p2", true, false, false);
            throwsWith(IllegalArgumentException.class, () -> st.newInstance(part, "p1", false, false, false),
                    "\"p1\"");
            throwsWith(IllegalArgumentException.class,
                    () -> st.setValue(part.instances.items[1], 0, "not an integer"), "takes Integer");
        }
        assertEquals(before, r.toString());
        assertNull(r.getClassDef("Nut"));
        assertSame(old, part.getInstances().getItem(0));
        part.createInstance().setID("p2"); // the staged identifier is free again

        try (Staging st = new Staging(r)) {
            st.addClass(classDef("Loop1", "Loop2", null, null));
            st.addClass(classDef("Loop2", "Loop1", null, null));
            throwsWith(IllegalArgumentException.class, st::finish, "cyclic");
        }
        assertEquals(1, r.getModels().getCount());
        assertEquals(1, part.createInstance().values.length);
    }
}
