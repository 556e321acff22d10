package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.BinaryFx.dump;
import static com.velmora.tessara.kdmreplica.BinaryFx.generate;
import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNotSame;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.util.ArrayList;
import java.util.Collections;
import java.util.Date;
import java.util.List;
import java.util.Random;
import java.util.concurrent.atomic.AtomicInteger;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.Timeout;

/** The binary form: exact round trips of everything a replica holds, the compression flag, refused writes. */
class BinaryCodecTest {

    private static Replica back(Replica r, boolean compressed) {
        return Replica.getReplicaFromBinary(Replica.getBinaryFromReplica(r, compressed), compressed);
    }

    @Test
    void generatedReplicasComeBackExactlyAndRewriteToTheSameBytes() {
        String seen = "";
        for (long seed = 1; seed <= 40; seed++) {
            Replica r = generate(seed, seed % 4 == 0 ? 25 : 6);
            String before = dump(r);
            seen += before;
            for (boolean compressed : new boolean[] {false, true}) {
                byte[] b = Replica.getBinaryFromReplica(r, compressed);
                Replica read = Replica.getReplicaFromBinary(b, compressed);
                assertEquals(before, dump(read), "seed " + seed + ", compressed " + compressed);
                assertArrayEquals(b, Replica.getBinaryFromReplica(read, compressed),
                        "seed " + seed + ": writing what was read changes the bytes");
            }
            assertEquals(before, dump(r), "writing changed the replica");
        }
        // The generated replicas really contain what the round trips are meant to cover.
        for (String feature : new String[] {" C ", " M ", " D ", "~", "!", "\\ud800", "d7ff8000000000123",
            "d8000000000000000", "t-9223372036854775808", "[]", "Composition", "Extension", "Read"}) {
            assertTrue(seen.contains(feature), "no generated replica holds " + feature);
        }
    }

    @Test
    void everyValueFormAndEdgeValueSurvives() {
        Replica r = new Replica("forms");
        Model m = addClass(r, "All", null);
        for (AttributeType t : AttributeType.values()) {
            addAttr(m, "s" + t, t, false);
            addAttr(m, "m" + t, t, true);
        }
        Instance x = m.createInstance();
        Instance empty = m.createInstance();
        x.setID(new byte[] {0, -1});
        empty.setID("\uDC00 alone");
        double nan = Double.longBitsToDouble(0x7ff80000000000abL);
        x.setValue("sInteger", Integer.MIN_VALUE);
        x.setValue("mInteger", new int[] {Integer.MAX_VALUE, -1, 0});
        x.setValue("sDouble", -0.0);
        x.setValue("mDouble", new double[] {nan, Double.NEGATIVE_INFINITY, Double.MIN_VALUE});
        x.setValue("sString", "");
        x.setValue("mString", new String[] {"\uD800", "\uD83D\uDE00", "\u0000", ""});
        x.setValue("sDate", new Date(Long.MIN_VALUE));
        x.setValue("mDate", new Date[] {new Date(Long.MAX_VALUE), new Date(-1)});
        x.setValue("sBoolean", false);
        x.setValue("mBoolean", new boolean[] {true, false, false, true, true, false, true, true, true});
        x.setValue("sBinary", new byte[0]);
        x.setValue("mBinary", new byte[][] {{}, {1, 2, 3}});
        x.setValue("sRelationship", x);
        x.setValue("mRelationship", new Instance[] {empty, x, empty});
        empty.setValue("mInteger", new int[0]);
        for (boolean compressed : new boolean[] {false, true}) {
            Replica read = back(r, compressed);
            Instance y = read.getModels().getItem(0).getInstances().getItem(0);
            Instance e = read.getModels().getItem(0).getInstances().getItem(1);
            assertArrayEquals(new byte[] {0, -1}, (byte[]) y.getID());
            assertEquals("\uDC00 alone", e.getID());
            assertEquals(Integer.MIN_VALUE, y.getValue("sInteger"));
            assertArrayEquals(new int[] {Integer.MAX_VALUE, -1, 0}, (int[]) y.getValue("mInteger"));
            assertEquals(Double.doubleToRawLongBits(-0.0), Double.doubleToRawLongBits((Double) y.getValue("sDouble")));
            assertEquals(0x7ff80000000000abL, Double.doubleToRawLongBits(((double[]) y.getValue("mDouble"))[0]));
            assertEquals("", y.getValue("sString"));
            assertArrayEquals(new String[] {"\uD800", "\uD83D\uDE00", "\u0000", ""}, (String[]) y.getValue("mString"));
            assertEquals(new Date(Long.MIN_VALUE), y.getValue("sDate"));
            assertArrayEquals(new Date[] {new Date(Long.MAX_VALUE), new Date(-1)}, (Date[]) y.getValue("mDate"));
            assertEquals(false, y.getValue("sBoolean"));
            assertArrayEquals(new boolean[] {true, false, false, true, true, false, true, true, true},
                    (boolean[]) y.getValue("mBoolean"));
            assertArrayEquals(new byte[0], (byte[]) y.getValue("sBinary"));
            assertArrayEquals(new byte[][] {{}, {1, 2, 3}}, (byte[][]) y.getValue("mBinary"));
            assertSame(y, y.getValue("sRelationship"));
            assertArrayEquals(new Instance[] {e, y, e}, (Instance[]) y.getValue("mRelationship"));
            assertArrayEquals(new int[0], (int[]) e.getValue("mInteger"), "an empty array is a value");
            assertFalse(e.isValuated("sInteger"));
            assertNull(e.getValue("mString"));
        }
    }

    @Test
    void statesDeletedInstancesAndLooseReferencesAreRestored() {
        Replica r = new Replica("states");
        Model part = addClass(r, "Part", null);
        addAttr(part, "n", AttributeType.Integer, false);
        AttributeDef link = addAttr(part, "link", AttributeType.Relationship, false);
        Instance kept = part.createInstance();
        Instance gone = part.createInstance();
        Instance changed = part.createInstance();
        gone.setID("p1");
        gone.setValue("n", 7);
        r.commit();
        changed.setValue("n", 1);
        kept.setValue("link", gone); // the reference outlives the removal of its target
        part.getInstances().remove(gone);
        Instance reused = part.createInstance();
        reused.setID("p1"); // a deleted and a live instance share an identifier
        Instance ghost = part.createInstance(); // created, referred to, removed before any commit
        ghost.setValue("n", 99);
        changed.setValue("link", ghost);
        part.getInstances().remove(ghost);
        link.targetNames = new String[] {"Elsewhere"}; // the values held no longer fit (setTargetNames refuses that)

        Replica read = back(r, true);
        InstanceSet s = read.getModels().getItem(0).getInstances();
        assertEquals(3, s.getCount());
        Instance k = s.getItem(0);
        Instance c = s.getItem(1);
        Instance n = s.getItem(2);
        assertTrue(k.isModified() && !k.isCreated());
        assertTrue(c.isModified());
        assertTrue(n.isCreated() && !n.isModified());
        assertEquals("p1", n.getID());
        Instance g = (Instance) k.getValue("link");
        assertTrue(g.isDeleted());
        assertEquals("p1", g.getID());
        assertEquals(7, g.getValue("n"));
        Instance h = (Instance) c.getValue("link");
        assertTrue(h.isDeleted());
        assertEquals(99, h.getValue("n"));
        assertEquals(-1, s.indexOf(h));
        assertEquals("Replica 'states' (1 classes, 3 instances, 1 deleted)", read.toString());

        // The restored replica behaves like the original: same refusal, same outcome once repaired.
        ReplicaCommitException a = assertThrows(ReplicaCommitException.class, r::commit);
        ReplicaCommitException b = assertThrows(ReplicaCommitException.class, read::commit);
        assertEquals(a.getViolations(), b.getViolations());
        k.clearValue("link");
        c.clearValue("link");
        read.commit();
        assertEquals("Replica 'states' (1 classes, 3 instances)", read.toString());
        assertTrue(gone.isDeleted() && kept.isModified(), "the original is untouched");
        throwsWith(IllegalArgumentException.class, () -> s.getItem(0).setID("p1"), "\"p1\"");
    }

    @Test
    void schemaPropertiesComeBackInForce() {
        Replica r = new Replica("schema");
        Model base = addClass(r, "Base", null);
        Model sub = addClass(r, "Sub", "Base");
        AttributeDef label = addAttr(base, "label", AttributeType.String, false);
        AttributeDef owns = addAttr(sub, "owns", AttributeType.Relationship, true);
        owns.setAggregationType(AggregationType.Composition);
        Instance parent = sub.createInstance();
        Instance child = base.createInstance();
        parent.setValue("label", "a long label");
        parent.setValue("owns", new Instance[] {child});
        label.length = 3; // below the value held (setLength refuses that)
        label.setAccessMode(AccessMode.Read);
        r.commit();

        Replica read = back(r, false);
        assertEquals("Base", read.getClassDef("Sub").getSuperName());
        Instance p = read.getModels().getItem("Sub").getInstances().getItem(0);
        assertEquals("a long label", p.getValue("label"), "a value held before the length was lowered");
        assertSame(read.getAttributeDef("Base.label"), read.getAttributeDef("Sub.label"));
        throwsWith(IllegalStateException.class, () -> p.setValue("label", "ab"), "read-only");
        read.getAttributeDef("Base.label").setAccessMode(AccessMode.ReadWrite);
        throwsWith(IllegalArgumentException.class, () -> p.setValue("label", "abcd"), "at most 3");
        read.getModels().getItem("Sub").getInstances().remove(p);
        assertEquals(0, read.getModels().getItem("Base").getInstances().getCount(), "composition removes the child");
        assertEquals(1, base.getInstances().getCount(), "the original keeps its own");
    }

    @Test
    void theFlagMustMatchTheHeader() {
        Replica r = generate(3, 4);
        byte[] plain = Replica.getBinaryFromReplica(r, false);
        byte[] packed = Replica.getBinaryFromReplica(r, true);
        assertEquals(0, plain[5]);
        assertEquals(1, packed[5]);
        throwsWith(ReplicaBinaryException.class, () -> Replica.getReplicaFromBinary(packed, false),
                "the bytes were written compressed but were read as uncompressed", "offset 5 of the buffer");
        throwsWith(ReplicaBinaryException.class, () -> Replica.getReplicaFromBinary(plain, true),
                "the bytes were written uncompressed but were read as compressed");
        throwsWith(IllegalArgumentException.class, () -> Replica.getReplicaFromBinary(null, true), "null");
        throwsWith(IllegalArgumentException.class, () -> Replica.getBinaryFromReplica(null, true), "null");

        Replica big = generate(4, 300);
        assertTrue(Replica.getBinaryFromReplica(big, true).length < Replica.getBinaryFromReplica(big, false).length);
    }

    @Test
    void referencesTheFormCannotCarryAreRefusedByName() {
        Replica r = new Replica("refs");
        Model a = addClass(r, "A", null);
        Model b = addClass(r, "B", null);
        addAttr(a, "to", AttributeType.Relationship, false);
        Instance x = a.createInstance();
        x.setID("x");
        x.setValue("to", b.createInstance());
        r.getModels().remove("B");
        throwsWith(IllegalArgumentException.class, () -> Replica.getBinaryFromReplica(r, false),
                "A[id=\"x\"]", "'A.to'", "class 'B' is not in the replica");

        Replica r2 = new Replica("refs2");
        Model c = addClass(r2, "C", null);
        addAttr(c, "to", AttributeType.Relationship, false);
        Instance y = c.createInstance();
        Instance z = c.createInstance();
        y.setValue("to", z);
        c.getInstances().remove(z);
        addAttr(c, "later", AttributeType.Integer, false);
        throwsWith(IllegalArgumentException.class, () -> Replica.getBinaryFromReplica(r2, true),
                "'C.to'", "attributes have changed");
        y.clearValue("to");
        assertEquals(dump(r2), dump(back(r2, true)));
    }

    /** Writers see a consistent replica while other threads change it. */
    @Test
    @Timeout(120)
    void snapshotsTakenWhileOthersWriteAreConsistent() throws Exception {
        Replica r = generate(11, 40);
        Model m = r.getModels().getItem(0);
        AtomicInteger raced = new AtomicInteger();
        List<Throwable> errors = Collections.synchronizedList(new ArrayList<>());
        List<Thread> threads = new ArrayList<>();
        for (int t = 0; t < 2; t++) {
            long seed = t;
            threads.add(new Thread(() -> {
                Random rnd = new Random(seed);
                for (int i = 0; i < 400; i++) {
                    try {
                        if (rnd.nextBoolean() || m.getInstances().getCount() == 0) {
                            m.createInstance().setID("w" + seed + "-" + i);
                        } else {
                            m.getInstances().remove(rnd.nextInt(m.getInstances().getCount()));
                        }
                    } catch (IndexOutOfBoundsException e) {
                        raced.incrementAndGet(); // the other writer removed in between: allowed
                    } catch (IllegalStateException e) {
                        // the other writer removed the new instance before its identifier was set
                        if (!e.getMessage().contains("is deleted")) {
                            errors.add(e);
                        }
                        raced.incrementAndGet();
                    } catch (Throwable e) {
                        errors.add(e);
                    }
                }
            }));
        }
        for (int t = 0; t < 2; t++) {
            boolean compressed = t == 1;
            threads.add(new Thread(() -> {
                try {
                    for (int i = 0; i < 25; i++) {
                        byte[] b = Replica.getBinaryFromReplica(r, compressed);
                        Replica read = Replica.getReplicaFromBinary(b, compressed);
                        assertArrayEquals(b, Replica.getBinaryFromReplica(read, compressed));
                    }
                } catch (Throwable e) {
                    errors.add(e);
                }
            }));
        }
        for (Thread t : threads) {
            t.start();
        }
        for (Thread t : threads) {
            t.join();
        }
        assertTrue(errors.isEmpty(), () -> "errors: " + errors);
        assertEquals(dump(r), dump(back(r, false)));
        assertNotSame(r, back(r, false));
    }
}
