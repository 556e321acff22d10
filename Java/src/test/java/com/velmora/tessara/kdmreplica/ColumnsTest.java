package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.lang.reflect.Array;
import java.util.Arrays;
import java.util.Date;
import org.junit.jupiter.api.function.Executable;
import org.junit.jupiter.api.Test;

/** Bulk columns: every type through create and get against getValue, all-or-nothing refusals, states, masks. */
class ColumnsTest {
    private static final AttributeType[] TYPES = AttributeType.values();
    private static final String[] NAMES = new String[14];

    static {
        for (int t = 0; t < 7; t++) {
            NAMES[t] = "s" + TYPES[t];
            NAMES[t + 7] = "m" + TYPES[t];
        }
    }

    /** "All" with s/m attributes of every type, "Sub(All)", "Other" whose sInteger is a String. */
    private static Replica schema() {
        StringBuilder b = new StringBuilder("All: ro Integer");
        for (AttributeType t : TYPES) {
            b.append(", s").append(t).append(' ').append(t).append(", m").append(t).append(' ').append(t).append('*');
        }
        Replica r = Fx.replica("cols", b + "; Sub(All): extra Integer; Other: sInteger String");
        r.getAttributeDef("ro").setAccessMode(AccessMode.Read);
        return r;
    }

    /** Row r of a column in the form getValue returns (dates as Date), or null for a Relationship without one. */
    private static Object cell(AttributeType t, boolean multi, Object col, int r) {
        Object[] a = col instanceof Object[] && (multi || t == AttributeType.String || t == AttributeType.Binary)
                ? (Object[]) col : null;
        if (!multi) {
            if (a != null) {
                int[] o = (int[]) a[1];
                return t == AttributeType.String ? new String((char[]) a[0], o[r], o[r + 1] - o[r])
                        : Arrays.copyOfRange((byte[]) a[0], o[r], o[r + 1]);
            }
            Object v = Array.get(col, r);
            return t == AttributeType.Date ? new Date((Long) v) : v;
        }
        int[] rows = (int[]) a[a.length - 1];
        Object out = Array.newInstance(t == AttributeType.Date ? Date.class : t == AttributeType.String ? String.class
                : t == AttributeType.Binary ? byte[].class : a[0].getClass().getComponentType(), rows[r + 1] - rows[r]);
        for (int e = rows[r]; e < rows[r + 1]; e++) {
            Object v = a.length == 3 ? cell(t, false, new Object[] {a[0], a[1]}, e) : Array.get(a[0], e);
            Array.set(out, e - rows[r], t == AttributeType.Date ? new Date((Long) v) : v);
        }
        return out;
    }

    /** Columns of 3 rows for NAMES; texts with an unpaired surrogate, empty values and lists. */
    private static Object[] columns(Instance a, Instance b) {
        return new Object[] {new int[] {7, Integer.MIN_VALUE, 0}, new double[] {Double.NaN, -0.0, 1e300},
            new Object[] {"h\u00e9\ud800x".toCharArray(), new int[] {0, 2, 2, 4}}, new long[] {-1, Long.MAX_VALUE, 0},
            new boolean[] {true, false, true}, new Object[] {new byte[] {1, 2, 3}, new int[] {0, 0, 3, 3}},
            new Object[] {a, b, a},
            new Object[] {new int[] {1, 2, 3}, new int[] {0, 0, 1, 3}},
            new Object[] {new double[] {0.5, -1}, new int[] {0, 2, 2, 2}},
            new Object[] {"ab\udc00cd".toCharArray(), new int[] {0, 2, 3, 3, 5}, new int[] {0, 1, 1, 4}},
            new Object[] {new long[] {5, -5}, new int[] {0, 1, 1, 2}},
            new Object[] {new boolean[] {false, true, true}, new int[] {0, 3, 3, 3}},
            new Object[] {new byte[] {9, 8, 7}, new int[] {0, 0, 3}, new int[] {0, 2, 2, 2}},
            new Object[] {new Instance[] {b, a, b}, new int[] {0, 0, 3, 3}}};
    }

    @Test
    void everyTypeRoundTripsThroughCreateAndGetWithMasksBothWays() {
        Replica r = schema();
        Model sub = r.getModels().getItem("Sub");
        Instance a = r.getModels().getItem("All").createInstance();
        Instance b = sub.createInstance();
        Object[] in = columns(a, b);
        boolean[][] masks = new boolean[14][];
        for (int k = 0; k < 14; k += 3) {
            masks[k] = new boolean[] {k % 2 == 0, true, false};
        }
        Instance[] xs = Columns.create(sub, 3, NAMES, in, masks);
        boolean[][] got = new boolean[14][];
        Object[] out = Columns.get(sub, NAMES, got);
        boolean[][] got2 = new boolean[14][];
        Object[] out2 = Columns.get(new Instance[] {xs[0], xs[1], xs[2]}, NAMES, got2);
        assertEquals(4, sub.getInstances().getCount());
        for (int k = 0; k < 14; k++) {
            for (int row = 0; row < 3; row++) {
                AttributeType t = TYPES[k % 7];
                boolean m = k >= 7;
                boolean present = masks[k] == null || masks[k][row];
                Object v = xs[row].getValue(NAMES[k]);
                String what = NAMES[k] + " row " + row;
                assertTrue(xs[row].isCreated() && !xs[row].isModified());
                same(present ? cell(t, m, in[k], row) : null, v, what);
                assertEquals(present, got[k][row + 1], what); // row 0 of the model is b
                assertEquals(present, got2[k][row], what);
                Object empty = m ? Array.newInstance(cell(t, true, out[k], row).getClass().getComponentType(), 0)
                        : t == AttributeType.Relationship ? null : t == AttributeType.String ? ""
                        : t == AttributeType.Binary ? new byte[0] : t == AttributeType.Date ? new Date(0)
                        : Array.get(Array.newInstance(in[k].getClass().getComponentType(), 1), 0);
                same(present ? v : empty, cell(t, m, out[k], row + 1), what);
                same(present ? v : empty, cell(t, m, out2[k], row), what);
            }
        }
    }

    @Test
    void refusalsNameRowAndAttributeAndChangeNothing() {
        Replica r = schema();
        r.getAttributeDef("sString").setLength(3);
        r.getAttributeDef("mBinary").setLength(2);
        r.getAttributeDef("sRelationship").setTargetNames(new String[] {"All"});
        Model sub = r.getModels().getItem("Sub");
        Instance t = sub.createInstance();
        Instance gone = sub.createInstance();
        Instance other = r.getModels().getItem("Other").createInstance();
        Instance foreign = schema().getModels().getItem("All").createInstance();
        boolean[][] noBlobs = new boolean[14][];
        noBlobs[12] = new boolean[3];
        Instance[] xs = Columns.create(sub, 3, NAMES, columns(t, t), noBlobs);
        r.commit();
        sub.getInstances().remove(gone);
        String before = dump(r);
        Instance[] three = {xs[0], xs[1], xs[2]};
        Object[][] rows = {
            {"sInteger,sDouble", new Object[] {new int[3], new float[3]}, "row 0", "'All.sDouble'", "expected double[rows]"},
            {"sInteger,sString", new Object[] {new int[3], new Object[] {"abcdefgh".toCharArray(), new int[] {0, 1, 2, 8}}},
                "row 2", "'All.sString'", "at most 3 characters; the value has 6"},
            {"mBinary", new Object[] {new Object[] {new byte[4], new int[] {0, 1, 4}, new int[] {0, 0, 2, 2}}},
                "row 1", "'All.mBinary'", "at most 2 bytes; element 1 has 3"},
            {"sInteger,ro", new Object[] {new int[3], new int[3]}, "row 0", "'All.ro'", "read-only"},
            {"sRelationship", new Object[] {new Instance[] {t, gone, t}}, "row 1", "'All.sRelationship'", "is deleted"},
            {"sRelationship", new Object[] {new Instance[] {t, t, foreign}}, "row 2", "not an instance of replica 'cols'"},
            {"mRelationship,sRelationship", new Object[] {new Object[] {new Instance[] {other}, new int[] {0, 1, 1, 1}},
                new Instance[] {other, t, t}}, "row 0", "'All.sRelationship'", "of class 'Other', not of a target"},
            {"mRelationship", new Object[] {new Object[] {new Object[] {t, "x"}, new int[] {0, 0, 0, 2}}}, "row 2",
                "element 1 is a java.lang.String"},
            {"mInteger", new Object[] {new Object[] {new int[2], new int[] {0, 1, 3, 3}}}, "row 1", "'All.mInteger'",
                "offsets 1..3 are out of range 0..2"},
            {"mInteger", new Object[] {new Object[] {new int[2], new int[] {0, 2, 1, 2}}}, "row 1", "offsets 2..1"},
            {"mString", new Object[] {new Object[] {new char[1], new int[] {0, 9}, new int[] {0, 0, 1, 1}}}, "row 1",
                "element 0: offsets 0..9"},
            {"sInteger,sDate", new Object[] {new int[3], new long[2]}, "row 2", "'All.sDate'", "2 rows, expected 3"},
            {"mDate", new Object[] {new Object[] {new long[0], new int[] {0, 0}}}, "row 1", "1 rows, expected 3"},
            {"sInteger,nope", new Object[] {new int[3], new int[3]}, "row 0", "'nope'", "class 'Sub' has no such attribute"},
            {"sInteger,sBoolean", new Object[] {new int[3], null}, "row 0", "'All.sBoolean'", "column is null"},
        };
        for (Object[] row : rows) {
            String[] names = ((String) row[0]).split(",");
            Object[] cols = (Object[]) row[1];
            String[] frags = Arrays.copyOfRange(row, 2, row.length, String[].class);
            throwsWith(IllegalArgumentException.class, () -> Columns.create(sub, 3, names, cols, null), frags);
            assertEquals(before, dump(r), "create " + row[0]);
            throwsWith(IllegalArgumentException.class, () -> Columns.set(three, names, cols, null), frags);
            assertEquals(before, dump(r), "set " + row[0]);
        }
        refusals(new Object[][] {
            {IllegalArgumentException.class, (Executable) () -> Columns.set(
                new Instance[] {xs[0], gone}, new String[] {"sInteger"}, new Object[] {new int[2]}, null),
                "row 1", "deleted"},
            {IllegalArgumentException.class, (Executable) () -> Columns.set(
                new Instance[] {xs[0], foreign}, new String[] {"sInteger"}, new Object[] {new int[2]}, null),
                "row 1", "not an instance of replica 'cols'"},
            {IllegalArgumentException.class, (Executable) () -> Columns.set(
                new Instance[] {xs[0], other}, new String[] {"sInteger"}, new Object[] {new int[2]}, null),
                "row 1", "'Other.sInteger'", "String, row 0's is Integer"},
            {IllegalArgumentException.class, (Executable) () -> Columns.create(sub, 3,
                new String[] {"sInteger"}, new Object[] {new int[3]}, new boolean[][] {new boolean[2]}),
                "row 2", "presence mask has 2 rows"},
        });
        assertEquals(before, dump(r));
    }

    @Test
    void setMarksWrittenInstancesModifiedAndLeavesMaskedOnesAlone() {
        Replica r = schema();
        Model all = r.getModels().getItem("All");
        Instance a = inst(all, "sInteger", 1, "sRelationship", all.createInstance());
        Instance b = inst(r.getModels().getItem("Sub"), "sInteger", 2, "sRelationship", a);
        r.commit();
        Instance c = all.createInstance();
        Columns.set(new Instance[] {a, b, c}, new String[] {"sInteger", "sRelationship"},
            new Object[] {new int[] {10, 20, 30}, new Instance[] {null, b, null}},
            new boolean[][] {{false, false, true}, {true, false, false}});
        assertEquals(Arrays.asList(1, 2, 30, null, a, null), Arrays.asList(a.getValue("sInteger"),
            b.getValue("sInteger"), c.getValue("sInteger"), a.getValue("sRelationship"), b.getValue("sRelationship"),
            c.getValue("sRelationship")));
        assertEquals("true false false / false false true", a.isModified() + " " + b.isModified() + " "
            + c.isModified() + " / " + a.isCreated() + " " + b.isCreated() + " " + c.isCreated());
    }
}
