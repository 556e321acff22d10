package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import java.util.*;
import java.util.concurrent.*;
import java.util.concurrent.atomic.AtomicInteger;
import org.junit.jupiter.api.Test;

/**
 * 8 threads read and 2 write one replica for a fixed number of operations (writers also change the
 * schema under the readers). The only exceptions allowed are the documented answers to a race lost:
 * a position that went out of range, an attribute that is gone, an instance deleted by the other
 * writer. Afterwards the replica must be consistent.
 */
class ThreadsTest {
    private static final int READERS = 8, WRITERS = 2, READ_OPS = 20_000, WRITE_OPS = 3_000, INITIAL = 200;
    private final AtomicInteger created = new AtomicInteger();
    private final AtomicInteger removed = new AtomicInteger();

    private void read(Replica r, Model part, Random rnd) {
        InstanceSet set = part.getInstances();
        int n = set.getCount();
        if (n > 0) {
            Instance x = set.getItem(rnd.nextInt(n));
            Object v = x.getValue("n");
            assertTrue(v == null || v instanceof Integer, () -> "n holds a " + v.getClass());
            x.toString(true);
            if (x.isValuated("tags")) {
                assertEquals(2, ((String[]) x.getValue("tags")).length);
            }
            Object ref = x.getValue("ref");
            if (ref != null) {
                ((Instance) ref).getID();
            }
            if (rnd.nextInt(10) == 0) {
                x.getValue("extra"); // may be gone
            }
        }
        if (rnd.nextInt(50) == 0) {
            r.toString();
            r.getAttributeDef("Part.n");
            part.getClassDef().getAttributes().getItem(rnd.nextInt(4));
        }
    }

    private void write(int w, Model part, Random rnd, int op) {
        InstanceSet set = part.getInstances();
        int choice = rnd.nextInt(10);
        if (choice < 5) {
            Instance x = part.createInstance();
            created.incrementAndGet();
            x.setID("w" + w + "-" + op);
            x.setValue("n", op);
            x.setValue("tags", new String[] {"a", "b"});
            x.setValue("ref", set.getItem(rnd.nextInt(set.getCount())));
        } else if (choice < 8) {
            int n = set.getCount();
            if (n > INITIAL / 2) {
                set.remove(rnd.nextInt(n));
                removed.incrementAndGet();
            }
        } else if (choice < 9) {
            set.getItem(rnd.nextInt(set.getCount())).setValue("n", -op);
        } else if (w == 0) {
            AttributeDefList attrs = part.getClassDef().getAttributes();
            if (attrs.includes("extra")) {
                attrs.remove("extra");
            } else {
                attrs.add(new AttributeDef("extra", AttributeType.Double));
            }
        } else {
            part.getClassDef().setQKAComment("op " + op);
        }
    }

    @Test
    void readersAndWritersEndConsistent() throws Exception {
        Replica r = replica("shared", "Part: n Integer, tags String*, ref Relationship, note String");
        Model part = r.getModels().getItem(0);
        for (int i = 0; i < INITIAL; i++) {
            inst(part, "n", i);
        }
        r.commit();
        Queue<Throwable> unexpected = new ConcurrentLinkedQueue<>();
        CountDownLatch start = new CountDownLatch(1);
        List<Thread> threads = new ArrayList<>();
        for (int t = 0; t < READERS + WRITERS; t++) {
            int id = t;
            threads.add(new Thread(() -> {
                Random rnd = new Random(1234 + id);
                try {
                    start.await();
                } catch (InterruptedException e) {
                    unexpected.add(e);
                }
                for (int op = 0; op < (id < WRITERS ? WRITE_OPS : READ_OPS); op++) {
                    try {
                        if (id < WRITERS) {
                            write(id, part, rnd, op);
                        } else {
                            read(r, part, rnd);
                        }
                    } catch (IndexOutOfBoundsException | IllegalArgumentException | IllegalStateException e) {
                        // documented: these exact classes with this package's messages (a raw AIOOBE would be a bug)
                        String m = String.valueOf(e.getMessage());
                        if (e.getClass().getSuperclass() != RuntimeException.class || !(m.startsWith("instance ")
                                || m.startsWith("attribute list of class ") || m.startsWith("replica "))) {
                            unexpected.add(e);
                        }
                    } catch (Throwable e) {
                        unexpected.add(e);
                    }
                }
            }));
            threads.get(t).start();
        }
        start.countDown();
        for (Thread t : threads) {
            t.join(120_000);
            assertFalse(t.isAlive(), "threads did not finish: deadlock?");
        }
        if (!unexpected.isEmpty()) {
            AssertionError e = new AssertionError(unexpected.size() + " undocumented exception(s)");
            unexpected.stream().limit(5).forEach(e::addSuppressed);
            throw e;
        }
        // consistency: counts, positions, layouts, identifier map
        InstanceSet set = part.getInstances();
        assertEquals(INITIAL + created.get() - removed.get(), set.getCount());
        int withId = 0;
        for (int k = 0; k < set.count; k++) {
            Instance x = set.items[k];
            assertEquals(k, x.pos);
            assertFalse(x.isDeleted());
            assertEquals(part.getClassDef().layout.length, x.values.length);
            if (x.id != null) {
                withId++;
                assertSame(x, part.ids.get(x.id));
            }
            if (x.getValue("ref") != null && ((Instance) x.getValue("ref")).isDeleted()) {
                x.clearValue("ref"); // references to instances removed meanwhile are the only thing commit may refuse
            }
        }
        assertEquals(withId, part.ids == null ? 0 : part.ids.size());
        r.commit();
        assertFalse(r.toString().contains("deleted"), r.toString());
    }
}
