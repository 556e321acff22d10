package com.velmora.tessara.kdmreplica;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.util.Arrays;
import java.util.concurrent.locks.Lock;
import java.util.concurrent.locks.ReentrantReadWriteLock;

/**
 * Values of many instances at once, one column per attribute, in forms that native code can pass
 * as one to three primitive arrays. Row {@code r} of a column belongs to instance {@code r}.
 *
 * <p>Column forms, single-valued: Integer {@code int[rows]}; Double {@code double[rows]}; Boolean
 * {@code boolean[rows]}; Date {@code long[rows]} (milliseconds); String
 * {@code {char[] utf16, int[] offsets}} and Binary {@code {byte[] bytes, int[] offsets}} with
 * {@code rows + 1} offsets, row {@code r} being {@code [offsets[r], offsets[r + 1])};
 * Relationship {@code Instance[rows]} (or an {@code Object[]} of instances; null there, in a
 * written row, clears the value).
 *
 * <p>Multi-valued: {@code {values, int[] offsets}} with values {@code int[]}, {@code double[]},
 * {@code boolean[]}, {@code long[]} or {@code Instance[]}, row {@code r} holding
 * {@code values[offsets[r] .. offsets[r + 1])}; String {@code {char[], int[] charOffsets,
 * int[] rowOffsets}} where row offsets index elements and element {@code e} is
 * {@code [charOffsets[e], charOffsets[e + 1])}; Binary likewise with {@code byte[]}.
 *
 * <p>Writes are all or nothing: every value is checked as {@code Instance.setValue} checks it
 * (and read-only attributes are refused) before anything is created or changed; a refusal is an
 * {@link IllegalArgumentException} naming the row (from 0), the attribute and the cause. Each call
 * takes its replica's lock once.
 */
public final class Columns {
    /** A written row whose relationship value is null: the value is cleared. */
    private static final Object CLEAR = new Object();

    private Columns() {
    }

    /**
     * Creates {@code rows} instances of the model (marked created, in row order) and sets, for each
     * k, attribute {@code attributes[k]} from {@code columns[k]} in the rows where
     * {@code present == null || present[k] == null || present[k][row]}.
     *
     * @return the new instances, in row order
     * @throws IllegalArgumentException naming row, attribute and cause; then nothing was created
     * @throws IllegalStateException when the model is in no replica
     */
    public static Instance[] create(Model model, int rows, String[] attributes, Object[] columns, boolean[][] present) {
        if (model == null || rows < 0) {
            throw new IllegalArgumentException("Columns.create: " + (model == null ? "model is null" : "rows " + rows
                    + " is negative"));
        }
        Lock l = Locks.write(model);
        try {
            Replica r = model.replica;
            if (r == null) {
                throw new IllegalStateException("model of class '" + model.classDef.name
                        + "' is in no replica: add it to a replica's model set before creating instances");
            }
            Batch b = new Batch("Columns.create", r, model, null, rows, attributes, columns, present);
            Object[][] stored = b.importAll();
            Instance[] xs = new Instance[rows];
            int n = model.alignedTo.length;
            model.instances.reserve(rows);
            for (int i = 0; i < rows; i++) {
                Instance x = new Instance(model, n);
                x.state = Instance.CREATED;
                model.instances.append(x);
                xs[i] = x;
            }
            b.apply(xs, stored);
            return xs;
        } finally {
            l.unlock();
        }
    }

    /**
     * Sets attributes of live instances of one replica (each may be of its own class) as
     * {@link #create} does; instances that get a value and are not created become modified.
     *
     * @throws IllegalArgumentException naming row, attribute and cause (a null, detached, deleted
     *         or foreign instance too); then no instance changed
     */
    public static void set(Instance[] instances, String[] attributes, Object[] columns, boolean[][] present) {
        if (instances == null) {
            throw new IllegalArgumentException("Columns.set: instances is null");
        }
        if (instances.length == 0) {
            Batch.shape("Columns.set", attributes, columns, present);
            return;
        }
        if (instances[0] == null || instances[0].model == null) {
            throw Batch.fail("Columns.set", 0, Batch.first(attributes), "the instance is " + (instances[0] == null ? "null" : "detached"));
        }
        Lock l = Locks.write(instances[0]);
        try {
            Replica r = instances[0].model.replica;
            for (int i = 0; i < instances.length; i++) {
                Instance x = instances[i];
                String bad = x == null ? "null" : x.model == null ? "detached" : r == null || x.model.replica != r
                        ? x.describe() + ", not an instance of replica '" + (r == null ? "?" : r.name) + "'"
                        : (x.state & Instance.DELETED) != 0 ? x.describe() + ", deleted" : null;
                if (bad != null) {
                    throw Batch.fail("Columns.set", i, Batch.first(attributes), "the instance is " + bad);
                }
            }
            Instance[] xs = instances.clone();
            Batch b = new Batch("Columns.set", r, null, xs, xs.length, attributes, columns, present);
            b.apply(xs, b.importAll());
        } finally {
            l.unlock();
        }
    }

    /**
     * The values of the instances, one column per attribute in the forms of {@link #create};
     * {@code present[k]} (when {@code present} is not null) receives a new {@code boolean[rows]}
     * telling which rows have a value. Rows without one hold 0, false, null or nothing.
     *
     * @throws IllegalArgumentException for no instances (the forms depend on the attributes'
     *         types: use {@link #get(Model, String[], boolean[][])}), a null, detached or foreign
     *         instance, an attribute a row's class lacks or holds with another type
     */
    public static Object[] get(Instance[] instances, String[] attributes, boolean[][] present) {
        if (instances == null || instances.length == 0) {
            throw new IllegalArgumentException("Columns.get: no instances (the columns' forms depend on the"
                    + " attributes' types; read a model's instances with get(Model, ...))");
        }
        if (instances[0] == null || instances[0].model == null) {
            throw Batch.fail("Columns.get", 0, Batch.first(attributes), "the instance is " + (instances[0] == null ? "null" : "detached"));
        }
        Lock l = Locks.read(instances[0]);
        try {
            ReentrantReadWriteLock d = Locks.domainOf(instances[0]);
            for (int i = 0; i < instances.length; i++) {
                Instance x = instances[i];
                if (x == null || x.model == null || Locks.domainOf(x) != d) {
                    throw Batch.fail("Columns.get", i, Batch.first(attributes), "the instance is " + (x == null ? "null"
                            : x.model == null ? "detached" : x.describe() + ", of another replica than row 0's"));
                }
            }
            return new Batch("Columns.get", null, null, instances, instances.length, attributes, null, null)
                    .exportAll(present);
        } finally {
            l.unlock();
        }
    }

    /** As {@link #get(Instance[], String[], boolean[][])} for the live instances of a model, in set order. */
    public static Object[] get(Model model, String[] attributes, boolean[][] present) {
        if (model == null) {
            throw new IllegalArgumentException("Columns.get: model is null");
        }
        Lock l = Locks.read(model);
        try {
            InstanceSet s = model.instances;
            return new Batch("Columns.get", null, model, Arrays.copyOf(s.items, s.count), s.count, attributes, null,
                    null).exportAll(present);
        } finally {
            l.unlock();
        }
    }

    /**
     * {@link #get(Model, String[], boolean[][])}'s columns followed by their presence masks, in one
     * array of twice as many elements (the form the native bridge reads).
     */
    public static Object[] getWithMasks(Model model, String[] attributes) {
        boolean[][] present = new boolean[attributes == null ? 0 : attributes.length][];
        return withMasks(get(model, attributes, present), present);
    }

    /** As {@link #getWithMasks(Model, String[])} for the instances. */
    public static Object[] getWithMasks(Instance[] instances, String[] attributes) {
        boolean[][] present = new boolean[attributes == null ? 0 : attributes.length][];
        return withMasks(get(instances, attributes, present), present);
    }

    private static Object[] withMasks(Object[] columns, boolean[][] present) {
        Object[] out = Arrays.copyOf(columns, 2 * columns.length);
        System.arraycopy(present, 0, out, columns.length, present.length);
        return out;
    }

    /** One call's rows and columns (the caller holds the replica's lock). */
    private static final class Batch {
        private final String op;
        private final Replica replica;
        /** The model of every row (create, get of a model), or null: each instance's own. */
        private final Model model;
        private final Instance[] xs;
        private final int rows;
        private final String[] names;
        private final Object[] columns;
        private final boolean[][] masks;
        /** Per column: the attribute position of each row. */
        private final int[][] positions;
        /** Target check cache: the last definition and class accepted. */
        private AttributeDef okDef;
        private Model okModel;

        Batch(String op, Replica replica, Model model, Instance[] xs, int rows, String[] names, Object[] columns,
                boolean[][] masks) {
            this.op = op;
            this.replica = replica;
            this.model = model;
            this.xs = xs;
            this.rows = rows;
            this.names = names;
            this.columns = columns;
            this.masks = masks;
            if (columns != null || masks != null) {
                shape(op, names, columns, masks);
            } else if (names == null) {
                throw new IllegalArgumentException(op + ": attributes is null");
            }
            this.positions = new int[names.length][];
        }

        static void shape(String op, String[] names, Object[] columns, boolean[][] masks) {
            if (names == null || columns == null || names.length != columns.length
                    || masks != null && masks.length != names.length) {
                throw new IllegalArgumentException(op + ": " + (names == null ? "attributes is null"
                        : columns == null ? "columns is null" : names.length + " attributes, " + columns.length
                        + " columns" + (masks == null ? "" : ", " + masks.length + " presence masks")));
            }
        }

        /** The attribute named in a refusal about an instance rather than a value. */
        static String first(String[] names) {
            return names == null || names.length == 0 ? "?" : String.valueOf(names[0]);
        }

        static IllegalArgumentException fail(String op, int row, String attribute, String cause) {
            return new IllegalArgumentException(op + ": row " + row + ", attribute '" + attribute + "': " + cause);
        }

        private IllegalArgumentException fail(int row, int k, AttributeDef def, String cause) {
            return fail(op, row, def == null ? String.valueOf(names[k]) : def.qualifiedName(), cause);
        }

        /** The definitions of column k by row (positions filled in); checks every row has it, of one type. */
        private AttributeDef[] resolve(int k) {
            String name = names[k];
            AttributeDef[] defs = new AttributeDef[Math.max(rows, model != null ? 1 : 0)];
            int[] pos = positions[k] = new int[rows];
            Model last = null;
            AttributeDef def = null;
            int p = -1;
            for (int r = 0; r < defs.length; r++) {
                Instance x = model != null ? null : xs[r];
                if (x != null && x.frozen != null) { // deleted and no longer tracked: its own layout
                    p = -1;
                    for (int i = 0; i < x.frozen.length && p < 0; i++) {
                        p = x.frozen[i].name.equals(name) ? i : -1;
                    }
                    def = p < 0 ? null : x.frozen[p];
                    last = null;
                } else if (x == null ? last != model : x.model != last) {
                    last = x == null ? model : x.model;
                    p = name == null ? -1 : last.classDef.positionOf(name);
                    def = p < 0 || p >= last.alignedTo.length ? null : last.alignedTo[p];
                }
                if (def == null) {
                    throw fail(r, k, null, "class '" + (x == null ? model : x.model).classDef.name
                            + "' has no such attribute");
                }
                if (r > 0 && (def.type != defs[0].type || def.multi != defs[0].multi)) {
                    throw fail(r, k, def, "it is " + kind(def) + ", row 0's is " + kind(defs[0]));
                }
                defs[r] = def;
                if (r < rows) {
                    pos[r] = p;
                }
            }
            return defs;
        }

        private static String kind(AttributeDef d) {
            return d.type + (d.multi ? ", multi-valued" : "");
        }

        private static String form(AttributeDef d) {
            switch (d.type) {
                case Integer: return d.multi ? "{int[] values, int[] offsets}" : "int[rows]";
                case Double: return d.multi ? "{double[] values, int[] offsets}" : "double[rows]";
                case Boolean: return d.multi ? "{boolean[] values, int[] offsets}" : "boolean[rows]";
                case Date: return d.multi ? "{long[] values, int[] offsets}" : "long[rows]";
                case String: return d.multi ? "{char[], int[] charOffsets, int[] rowOffsets}" : "{char[], int[] offsets}";
                case Binary: return d.multi ? "{byte[], int[] byteOffsets, int[] rowOffsets}" : "{byte[], int[] offsets}";
                default: return d.multi ? "{Instance[] values, int[] offsets}" : "Instance[rows]";
            }
        }

        /** A column taken apart: the values, the offsets by row and, for multi-valued texts and bytes, by element. */
        private final class In {
            final int k;
            final AttributeDef def;
            Object values;
            int[] rowOffsets;
            int[] elementOffsets;
            int limit;

            In(int k, AttributeDef def) {
                this.k = k;
                this.def = def;
                Object c = columns[k];
                boolean texts = def.type == AttributeType.String || def.type == AttributeType.Binary;
                Class<?> vc = valuesClass(def.type);
                if (c == null) {
                    throw fail(0, k, def, "the column is null, expected " + form(def));
                }
                if (!def.multi && !texts) {
                    if (!vc.isInstance(c)) {
                        throw wrong(c);
                    }
                    values = c;
                    length(java.lang.reflect.Array.getLength(c), "values");
                    return;
                }
                int parts = def.multi && texts ? 3 : 2;
                if (c.getClass() != Object[].class || ((Object[]) c).length != parts) {
                    throw wrong(c);
                }
                Object[] a = (Object[]) c;
                if (!vc.isInstance(a[0]) || !(a[1] instanceof int[]) || parts == 3 && !(a[2] instanceof int[])) {
                    throw wrong(c);
                }
                values = a[0];
                rowOffsets = (int[]) a[parts - 1];
                length(rowOffsets.length - 1, "offsets");
                if (parts == 3) {
                    elementOffsets = (int[]) a[1];
                    limit = Math.max(0, elementOffsets.length - 1);
                } else {
                    limit = java.lang.reflect.Array.getLength(values);
                }
                for (int r = 0; r < rows; r++) {
                    int from = rowOffsets[r];
                    int to = rowOffsets[r + 1];
                    if (from < 0 || from > to || to > limit) {
                        throw fail(r, k, def, "offsets " + from + ".." + to + " are out of range 0.." + limit
                                + " or decreasing");
                    }
                }
            }

            private IllegalArgumentException wrong(Object c) {
                StringBuilder b = new StringBuilder("the column is ").append(Values.className(c));
                if (c.getClass() == Object[].class) {
                    b.append(" {");
                    Object[] a = (Object[]) c;
                    for (int i = 0; i < a.length; i++) {
                        b.append(i == 0 ? "" : ", ").append(a[i] == null ? "null" : Values.className(a[i]));
                    }
                    b.append('}');
                }
                return fail(0, k, def, b.append(", expected ").append(form(def)).toString());
            }

            private void length(int n, String what) {
                if (n != rows) {
                    throw fail(Math.max(0, Math.min(n, rows)), k, def, "the column has " + what + " for " + Math.max(0, n)
                            + " rows, expected " + rows);
                }
            }

            /** The stored form of row r's value (all checks done), or CLEAR. */
            Object value(int r, AttributeDef d) {
                int from = rowOffsets == null ? r : rowOffsets[r];
                int to = rowOffsets == null ? r + 1 : rowOffsets[r + 1];
                switch (d.type) {
                    case Integer:
                        return d.multi ? Arrays.copyOfRange((int[]) values, from, to) : (Object) ((int[]) values)[r];
                    case Double:
                        return d.multi ? Arrays.copyOfRange((double[]) values, from, to) : (Object) ((double[]) values)[r];
                    case Boolean:
                        return d.multi ? Arrays.copyOfRange((boolean[]) values, from, to)
                                : (Object) ((boolean[]) values)[r];
                    case Date:
                        return d.multi ? Arrays.copyOfRange((long[]) values, from, to) : (Object) ((long[]) values)[r];
                    case String:
                        if (!d.multi) {
                            return text(r, d, from, to, -1);
                        }
                        String[] texts = new String[to - from];
                        for (int e = from; e < to; e++) {
                            texts[e - from] = text(r, d, elementOffsets[e], elementOffsets[e + 1], e - from);
                        }
                        return texts;
                    case Binary:
                        if (!d.multi) {
                            return bytes(r, d, from, to, -1);
                        }
                        byte[][] blobs = new byte[to - from][];
                        for (int e = from; e < to; e++) {
                            blobs[e - from] = bytes(r, d, elementOffsets[e], elementOffsets[e + 1], e - from);
                        }
                        return blobs;
                    default:
                        Object[] refs = (Object[]) values;
                        if (!d.multi) {
                            return refs[r] == null ? CLEAR : target(r, k, d, refs[r], -1);
                        }
                        Instance[] out = new Instance[to - from];
                        for (int e = from; e < to; e++) {
                            out[e - from] = target(r, k, d, refs[e], e - from);
                        }
                        return out;
                }
            }

            private void element(int r, AttributeDef d, int from, int to, int n, int element) {
                if (from < 0 || from > to || to > n) {
                    throw fail(r, k, d, where(element) + ": offsets " + from + ".." + to + " are out of range 0.."
                            + n + " or decreasing");
                }
            }

            private String text(int r, AttributeDef d, int from, int to, int element) {
                char[] cs = (char[]) values;
                element(r, d, from, to, cs.length, element);
                if (d.length > 0 && to - from > d.length) {
                    int n = Character.codePointCount(cs, from, to - from);
                    if (n > d.length) {
                        throw fail(r, k, d, "holds at most " + d.length + " characters; " + where(element) + " has " + n);
                    }
                }
                return new String(cs, from, to - from);
            }

            private byte[] bytes(int r, AttributeDef d, int from, int to, int element) {
                element(r, d, from, to, ((byte[]) values).length, element);
                if (d.length > 0 && to - from > d.length) {
                    throw fail(r, k, d, "holds at most " + d.length + " bytes; " + where(element) + " has "
                            + (to - from));
                }
                return Arrays.copyOfRange((byte[]) values, from, to);
            }
        }

        private static Class<?> valuesClass(AttributeType t) {
            switch (t) {
                case Integer: return int[].class;
                case Double: return double[].class;
                case Boolean: return boolean[].class;
                case Date: return long[].class;
                case String: return char[].class;
                case Binary: return byte[].class;
                default: return Object[].class;
            }
        }

        private static String where(int element) {
            return element < 0 ? "the value" : "element " + element;
        }

        private Instance target(int r, int k, AttributeDef d, Object o, int element) {
            if (!(o instanceof Instance)) {
                throw fail(r, k, d, where(element) + " is " + (o == null ? "null" : "a " + Values.className(o))
                        + ", expected Instance");
            }
            Instance t = (Instance) o;
            Model m = t.model;
            if (m == null || m.replica != replica) {
                throw fail(r, k, d, where(element) + ", " + t.describe() + ", is not an instance of replica '"
                        + replica.name + "'");
            }
            if ((t.state & Instance.DELETED) != 0) {
                throw fail(r, k, d, where(element) + ", " + t.describe() + ", is deleted");
            }
            if (m != okModel || d != okDef) {
                if (!Values.isTarget(d.targetNames, m.classDef, replica.models)) {
                    throw fail(r, k, d, where(element) + ", " + t.describe() + ", is of class '" + m.classDef.name
                            + "', not of a target class " + Arrays.toString(d.targetNames));
                }
                okModel = m;
                okDef = d;
            }
            return t;
        }

        /** Checks every column and returns the stored values by column and row (null: row not written). */
        Object[][] importAll() {
            Object[][] stored = new Object[names.length][];
            for (int k = 0; k < names.length; k++) {
                AttributeDef[] defs = resolve(k);
                In in = new In(k, defs[0]);
                boolean[] mask = masks == null ? null : masks[k];
                if (mask != null && mask.length != rows) {
                    throw fail(Math.min(mask.length, rows), k, defs[0], "the presence mask has " + mask.length
                            + " rows, expected " + rows);
                }
                Object[] out = stored[k] = new Object[rows];
                for (int r = 0; r < rows; r++) {
                    if (mask == null || mask[r]) {
                        AttributeDef d = defs[model != null ? 0 : r];
                        if (d.accessMode == AccessMode.Read) {
                            throw fail(r, k, d, "it is read-only (access mode Read)");
                        }
                        out[r] = in.value(r, d);
                    }
                }
            }
            return stored;
        }

        /** Writes checked values; instances that got one and are not created become modified. */
        void apply(Instance[] targets, Object[][] stored) {
            boolean[] touched = new boolean[rows];
            for (int k = 0; k < stored.length; k++) {
                Object[] col = stored[k];
                int[] pos = positions[k];
                for (int r = 0; r < rows; r++) {
                    Object v = col[r];
                    if (v != null) {
                        targets[r].values[pos[r]] = v == CLEAR ? null : v;
                        touched[r] = true;
                    }
                }
            }
            for (int r = 0; r < rows; r++) {
                Instance x = targets[r];
                if (touched[r] && (x.state & Instance.CREATED) == 0) {
                    x.state |= Instance.MODIFIED;
                }
            }
        }

        Object[] exportAll(boolean[][] present) {
            if (present != null && present.length != names.length) {
                throw new IllegalArgumentException(op + ": " + names.length + " attributes, " + present.length
                        + " presence masks");
            }
            Object[] out = new Object[names.length];
            for (int k = 0; k < names.length; k++) {
                AttributeDef[] defs = resolve(k);
                int[] pos = positions[k];
                Object[] vs = new Object[rows];
                boolean[] has = new boolean[rows];
                for (int r = 0; r < rows; r++) {
                    vs[r] = xs[r].values[pos[r]];
                    has[r] = vs[r] != null;
                }
                out[k] = export(defs[0], vs, k);
                if (present != null) {
                    present[k] = has;
                }
            }
            return out;
        }

        /** A column of stored values (null: none) in its form. */
        private Object export(AttributeDef d, Object[] vs, int k) {
            int n = vs.length;
            if (!d.multi) {
                switch (d.type) {
                    case Integer: {
                        int[] a = new int[n];
                        for (int r = 0; r < n; r++) {
                            a[r] = vs[r] == null ? 0 : (Integer) vs[r];
                        }
                        return a;
                    }
                    case Double: {
                        double[] a = new double[n];
                        for (int r = 0; r < n; r++) {
                            a[r] = vs[r] == null ? 0 : (Double) vs[r];
                        }
                        return a;
                    }
                    case Boolean: {
                        boolean[] a = new boolean[n];
                        for (int r = 0; r < n; r++) {
                            a[r] = vs[r] != null && (Boolean) vs[r];
                        }
                        return a;
                    }
                    case Date: {
                        long[] a = new long[n];
                        for (int r = 0; r < n; r++) {
                            a[r] = vs[r] == null ? 0 : (Long) vs[r];
                        }
                        return a;
                    }
                    case Relationship:
                        return Arrays.copyOf(vs, n, Instance[].class);
                    default:
                        break;
                }
            }
            boolean text = d.type == AttributeType.String;
            int[] rowOffsets = new int[n + 1];
            long total = 0;
            for (int r = 0; r < n; r++) {
                total += vs[r] == null ? 0 : size(vs[r], d.multi, text);
                rowOffsets[r + 1] = (int) Math.min(total, Integer.MAX_VALUE);
            }
            if (total > Integer.MAX_VALUE - 16) {
                throw fail(n - 1, k, d, "the column would exceed one Java array (" + total + " elements)");
            }
            int t = (int) total;
            switch (d.type) {
                case String:
                case Binary:
                    if (!d.multi) {
                        Object flat = text ? new char[t] : new byte[t];
                        for (int r = 0; r < n; r++) {
                            put(vs[r], flat, rowOffsets[r], text);
                        }
                        return new Object[] {flat, rowOffsets};
                    }
                    int[] elementOffsets = new int[t + 1];
                    long chars = 0;
                    for (int r = 0, e = 0; r < n; r++) {
                        for (Object v : vs[r] == null ? new Object[0] : (Object[]) vs[r]) {
                            chars += text ? ((String) v).length() : ((byte[]) v).length;
                            elementOffsets[++e] = (int) Math.min(chars, Integer.MAX_VALUE);
                        }
                    }
                    if (chars > Integer.MAX_VALUE - 16) {
                        throw fail(n - 1, k, d, "the column would exceed one Java array (" + chars + " elements)");
                    }
                    Object flat = text ? new char[(int) chars] : new byte[(int) chars];
                    for (int r = 0, e = 0; r < n; r++) {
                        for (Object v : vs[r] == null ? new Object[0] : (Object[]) vs[r]) {
                            put(v, flat, elementOffsets[e++], text);
                        }
                    }
                    return new Object[] {flat, elementOffsets, rowOffsets};
                default:
                    Object flatValues = d.type == AttributeType.Relationship ? new Instance[t]
                            : java.lang.reflect.Array.newInstance(valuesClass(d.type).getComponentType(), t);
                    for (int r = 0; r < n; r++) {
                        if (vs[r] != null) {
                            System.arraycopy(vs[r], 0, flatValues, rowOffsets[r], rowOffsets[r + 1] - rowOffsets[r]);
                        }
                    }
                    return new Object[] {flatValues, rowOffsets};
            }
        }

        private static int size(Object v, boolean multi, boolean text) {
            if (multi) {
                return java.lang.reflect.Array.getLength(v);
            }
            return text ? ((String) v).length() : ((byte[]) v).length;
        }

        private static void put(Object v, Object flat, int at, boolean text) {
            if (v instanceof String) {
                ((String) v).getChars(0, ((String) v).length(), (char[]) flat, at);
            } else if (v != null) {
                System.arraycopy(v, 0, flat, at, ((byte[]) v).length);
            }
        }
    }
}
