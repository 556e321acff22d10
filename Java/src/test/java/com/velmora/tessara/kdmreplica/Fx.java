package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import org.junit.jupiter.api.function.Executable;

/** Small builders for the tests. */
final class Fx {
    private Fx() {
    }

    /** Adds a class (with an optional super name) and its model to the replica. */
    static Model addClass(Replica r, String name, String superName) {
        ClassDef c = new ClassDef(name);
        if (superName != null) {
            c.setSuperName(superName);
        }
        Model m = new Model(c);
        r.getModels().add(m);
        return m;
    }

    static AttributeDef addAttr(Model m, String name, AttributeType type, boolean multi) {
        AttributeDef a = new AttributeDef(name, type);
        a.setMultiValuation(multi);
        m.getClassDef().getAttributes().add(a);
        return a;
    }

    /** Asserts that the call throws {@code type} and that the message contains every fragment. */
    static <T extends Throwable> T throwsWith(Class<T> type, Executable call, String... fragments) {
        T e = assertThrows(type, call);
        for (String f : fragments) {
            assertTrue(e.getMessage() != null && e.getMessage().contains(f),
                    () -> "message \"" + e.getMessage() + "\" lacks \"" + f + "\"");
        }
        return e;
    }
}
