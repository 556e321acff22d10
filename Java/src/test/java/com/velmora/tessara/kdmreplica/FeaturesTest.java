package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import com.velmora.tessara.ReplicaHolder;
import java.util.Date;
import org.junit.jupiter.api.Test;

/** Process-wide features, text forms, definition properties. */
class FeaturesTest {

    @Test
    void featuresHaveDefaultsAndUnknownNamesListTheKnownOnes() {
        assertFalse(Replica.getFeature("validate"));
        assertTrue(Replica.getFeature("indent"));
        throwsWith(IllegalArgumentException.class, () -> Replica.setFeature("Indent", true), "'Indent'", "validate, indent");
        throwsWith(IllegalArgumentException.class, () -> Replica.setFeature(null, true), "null", "validate");
    }

    @Test
    void textFormsNameTheirObject() {
        Replica r = replica("shop", "Part: name String, made Date, sizes Integer*, blob Binary; Bolt(Part)");
        Model part = r.getModels().getItem("Part");
        AttributeDef name = r.getAttributeDef("Part.name");
        name.setMandatory(true);
        name.setLength(20);
        Instance p = inst(part, "name", "nut\n", "made", new Date(0), "sizes", new int[] {1, 2}, "blob", new byte[] {10, -1});
        p.setID("p\"1");
        Instance b = r.getModels().getItem("Bolt").createInstance();
        assertEquals("Replica 'shop' (2 classes, 2 instances)", r.toString());
        assertEquals("ModelSet of replica 'shop' [Part, Bolt]", r.getModels().toString());
        assertEquals("Model 'Part' (1 instances) in replica 'shop'", part.toString());
        assertEquals("ClassDef 'Bolt' extends 'Part' (0 own attributes, 4 in all)", r.getClassDef("Bolt").toString());
        assertEquals("AttributeDefList of 'Part' [name, made, sizes, blob]", part.getClassDef().getAttributes().toString());
        assertEquals("AttributeDef 'Part.name' String mandatory length=20", name.toString());
        assertEquals("InstanceSet of 'Part' (1 instances)", part.getInstances().toString());
        assertEquals("Instance Part[id=\"p\\\"1\"] created", p.toString());
        assertEquals("Instance Part[id=\"p\\\"1\"] created {name=\"nut\\n\", made=1970-01-01T00:00:00Z, "
                + "sizes=[1, 2], blob=0x0aff}", p.toString(true));
        assertEquals("Instance Bolt[#0] created {}", b.toString(true));
        assertEquals("ReplicaHolder[Replica 'shop' (2 classes, 2 instances)]", new ReplicaHolder(r).toString());
        assertEquals("ReplicaHolder[empty]", new ReplicaHolder().toString());
    }

    @Test
    void definitionPropertiesAreCopiedBothWays() {
        ClassDef c = new ClassDef("Part");
        String[] scopes = {"a", "b"};
        c.setScopeNames(scopes);
        scopes[0] = "z";
        c.getScopeNames()[1] = "z";
        assertArrayEquals(new String[] {"a", "b"}, c.getScopeNames());
        c.setScopeNames(null);
        assertEquals(0, c.getScopeNames().length);
        c.setQKAComment(null);
        assertEquals("", c.getQKAComment());
        throwsWith(IllegalArgumentException.class, () -> c.setScopeNames(new String[] {"a", null}), "element 1");
        throwsWith(IllegalArgumentException.class, () -> c.setClassType(null), "'Part'", "class type is null");
        AttributeDef a = new AttributeDef("ref", AttributeType.Relationship);
        String[] refs = {"r1"};
        a.setTargetRefs(refs);
        refs[0] = "x";
        assertArrayEquals(new String[] {"r1"}, a.getTargetRefs());
        assertEquals(AggregationType.Shared, a.getAggregationType());
    }
}
