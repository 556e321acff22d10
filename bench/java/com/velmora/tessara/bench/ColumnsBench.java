package com.velmora.tessara.bench;

import com.velmora.tessara.kdmreplica.AttributeDef;
import com.velmora.tessara.kdmreplica.AttributeType;
import com.velmora.tessara.kdmreplica.ClassDef;
import com.velmora.tessara.kdmreplica.Columns;
import com.velmora.tessara.kdmreplica.Instance;
import com.velmora.tessara.kdmreplica.Model;
import com.velmora.tessara.kdmreplica.Replica;
import java.util.Arrays;
import java.util.Date;
import java.util.Random;

/**
 * Bulk columns against the one-value-at-a-time calls: filling instances × 8 attributes (int,
 * double, text, date, boolean, bytes, reference, list of ints) through Columns.create against
 * createInstance + setValue, and reading them through Columns.get against getValue into arrays.
 * Inputs are made before timing, each side in its own forms. Median of the repetitions after
 * warm-up; targets printed beside the ratios, nothing asserted.
 *
 * <p>Usage: {@code ColumnsBench [instances [repetitions]]} (default 100000 and 7).
 */
public final class ColumnsBench {
    private static final String[] NAMES = {"i", "d", "s", "t", "b", "x", "r", "l"};
    private static final AttributeType[] TYPES = {AttributeType.Integer, AttributeType.Double, AttributeType.String,
        AttributeType.Date, AttributeType.Boolean, AttributeType.Binary, AttributeType.Relationship,
        AttributeType.Integer};

    private ColumnsBench() {
    }

    private static Model[] replica() {
        Replica r = new Replica("bench");
        Model item = new Model(new ClassDef("Item"));
        Model ref = new Model(new ClassDef("Ref"));
        r.getModels().add(item);
        r.getModels().add(ref);
        for (int k = 0; k < NAMES.length; k++) {
            AttributeDef a = new AttributeDef(NAMES[k], TYPES[k]);
            a.setMultiValuation(k == 7);
            if (k == 6) {
                a.setTargetNames(new String[] {"Ref"});
            }
            item.getClassDef().getAttributes().add(a);
        }
        for (int i = 0; i < 1000; i++) {
            ref.createInstance();
        }
        return new Model[] {item, ref};
    }

    private static double median(long[] t) {
        long[] s = t.clone();
        Arrays.sort(s);
        return s[s.length / 2] / 1e6;
    }

    public static void main(String[] args) {
        int n = args.length > 0 ? Integer.parseInt(args[0]) : 100_000;
        int reps = args.length > 1 ? Integer.parseInt(args[1]) : 7;
        Random rnd = new Random(42);
        int[] ints = new int[n];
        double[] doubles = new double[n];
        String[] texts = new String[n];
        long[] millis = new long[n];
        Date[] dates = new Date[n];
        boolean[] bools = new boolean[n];
        byte[][] blobs = new byte[n][];
        int[][] lists = new int[n][];
        int[] refIndex = new int[n];
        StringBuilder chars = new StringBuilder();
        int[] charOffsets = new int[n + 1];
        int[] byteOffsets = new int[n + 1];
        int[] listOffsets = new int[n + 1];
        for (int r = 0; r < n; r++) {
            ints[r] = rnd.nextInt();
            doubles[r] = rnd.nextDouble();
            texts[r] = "item-" + r + (r % 3 == 0 ? " \u00e9t\u00e9" : "");
            chars.append(texts[r]);
            charOffsets[r + 1] = chars.length();
            millis[r] = 1_600_000_000_000L + rnd.nextInt(1 << 30);
            dates[r] = new Date(millis[r]);
            bools[r] = rnd.nextBoolean();
            blobs[r] = new byte[8 + r % 9];
            rnd.nextBytes(blobs[r]);
            byteOffsets[r + 1] = byteOffsets[r] + blobs[r].length;
            lists[r] = new int[r % 5];
            Arrays.fill(lists[r], r);
            listOffsets[r + 1] = listOffsets[r] + lists[r].length;
            refIndex[r] = rnd.nextInt(1000);
        }
        char[] utf16 = chars.toString().toCharArray();
        byte[] bytes = new byte[byteOffsets[n]];
        int[] listValues = new int[listOffsets[n]];
        for (int r = 0; r < n; r++) {
            System.arraycopy(blobs[r], 0, bytes, byteOffsets[r], blobs[r].length);
            System.arraycopy(lists[r], 0, listValues, listOffsets[r], lists[r].length);
        }

        long[] tSet = new long[reps];
        long[] tCreate = new long[reps];
        long[] tGetValue = new long[reps];
        long[] tGet = new long[reps];
        long check = 0;
        for (int rep = -3; rep < reps; rep++) {
            // one value at a time
            Model[] ms = replica();
            Instance[] refs = new Instance[n];
            for (int r = 0; r < n; r++) {
                refs[r] = ms[1].getInstances().getItem(refIndex[r]);
            }
            System.gc();
            long t0 = System.nanoTime();
            for (int r = 0; r < n; r++) {
                Instance x = ms[0].createInstance();
                x.setValue("i", ints[r]);
                x.setValue("d", doubles[r]);
                x.setValue("s", texts[r]);
                x.setValue("t", dates[r]);
                x.setValue("b", bools[r]);
                x.setValue("x", blobs[r]);
                x.setValue("r", refs[r]);
                x.setValue("l", lists[r]);
            }
            long t1 = System.nanoTime();
            int[] gi = new int[n];
            double[] gd = new double[n];
            String[] gs = new String[n];
            long[] gt = new long[n];
            boolean[] gb = new boolean[n];
            byte[][] gx = new byte[n][];
            Instance[] gr = new Instance[n];
            int[][] gl = new int[n][];
            System.gc();
            long t2 = System.nanoTime();
            for (int r = 0; r < n; r++) {
                Instance x = ms[0].getInstances().getItem(r);
                gi[r] = (Integer) x.getValue("i");
                gd[r] = (Double) x.getValue("d");
                gs[r] = (String) x.getValue("s");
                gt[r] = ((Date) x.getValue("t")).getTime();
                gb[r] = (Boolean) x.getValue("b");
                gx[r] = (byte[]) x.getValue("x");
                gr[r] = (Instance) x.getValue("r");
                gl[r] = (int[]) x.getValue("l");
            }
            long t3 = System.nanoTime();
            check += gi[n - 1] + gs[n / 2].length() + gx[3].length + gl[n - 1].length + (gr[0] == null ? 1 : 0);

            // columns
            Model[] mc = replica();
            Instance[] refs2 = new Instance[n];
            for (int r = 0; r < n; r++) {
                refs2[r] = mc[1].getInstances().getItem(refIndex[r]);
            }
            Object[] columns = {ints, doubles, new Object[] {utf16, charOffsets}, millis, bools,
                new Object[] {bytes, byteOffsets}, refs2, new Object[] {listValues, listOffsets}};
            System.gc();
            long t4 = System.nanoTime();
            Columns.create(mc[0], n, NAMES, columns, null);
            long t5 = System.nanoTime();
            boolean[][] present = new boolean[NAMES.length][];
            System.gc();
            long t6 = System.nanoTime();
            Object[] got = Columns.get(mc[0], NAMES, present);
            long t7 = System.nanoTime();
            check += ((int[]) got[0])[n - 1] + ((char[]) ((Object[]) got[2])[0]).length + (present[7][0] ? 1 : 0);
            if (rep >= 0) {
                tSet[rep] = t1 - t0;
                tGetValue[rep] = t3 - t2;
                tCreate[rep] = t5 - t4;
                tGet[rep] = t7 - t6;
            }
        }
        double set = median(tSet);
        double create = median(tCreate);
        double getValue = median(tGetValue);
        double get = median(tGet);
        System.out.printf("%d instances x %d attributes, median of %d (check %d)%n", n, NAMES.length, reps, check);
        System.out.printf("fill: createInstance + setValue %.1f ms, Columns.create %.1f ms, ratio %.2f (target <= 1.2)%n",
                set, create, create / set);
        System.out.printf("read: getValue into arrays %.1f ms, Columns.get %.1f ms, ratio %.2f (target <= 1.2)%n",
                getValue, get, get / getValue);
    }
}
