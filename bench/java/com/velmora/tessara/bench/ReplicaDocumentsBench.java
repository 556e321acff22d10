package com.velmora.tessara.bench;

import com.velmora.tessara.kdmreplica.AttributeDef;
import com.velmora.tessara.kdmreplica.AttributeType;
import com.velmora.tessara.kdmreplica.ClassDef;
import com.velmora.tessara.kdmreplica.Instance;
import com.velmora.tessara.kdmreplica.Model;
import com.velmora.tessara.kdmreplica.Progress;
import com.velmora.tessara.kdmreplica.Replica;
import java.io.BufferedInputStream;
import java.io.IOException;
import java.io.InputStream;
import java.io.Reader;
import java.io.StringReader;
import java.io.UncheckedIOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.charset.StandardCharsets;
import java.util.Arrays;
import java.util.Date;
import java.util.Random;
import java.util.function.Supplier;
import javax.xml.XMLConstants;
import javax.xml.stream.XMLInputFactory;
import javax.xml.stream.XMLStreamException;
import javax.xml.stream.XMLStreamReader;

/**
 * Documents of the replica package, measured against a baseline taken in the same run: XML reading
 * against a bare StAX pass over the same document, the binary form against XML, and the heap an
 * instance costs beyond its values.
 *
 * <p>Usage: {@code ReplicaDocumentsBench [instances [repetitions]]} (default 200000 and 5). Each
 * timing is preceded by warm-up runs and reported as the median of the repetitions. Targets are
 * printed beside the figures; nothing here asserts them.
 */
public final class ReplicaDocumentsBench {
    private static final String CLASS = "Item";
    /** Eight attributes of mixed scalar types. */
    private static final String[] NAMES = {"code", "count", "price", "weight", "label", "note", "since", "active"};
    private static final AttributeType[] TYPES = {AttributeType.Integer, AttributeType.Integer, AttributeType.Double,
        AttributeType.Double, AttributeType.String, AttributeType.String, AttributeType.Date, AttributeType.Boolean};

    private ReplicaDocumentsBench() {
    }

    public static void main(String[] args) throws Exception {
        int n = args.length > 0 ? Integer.parseInt(args[0]) : 200_000;
        int reps = args.length > 1 ? Integer.parseInt(args[1]) : 5;
        int warm = Math.max(1, Math.min(2, reps));
        System.out.printf("Replica documents: %d instances of one class with %d scalar attributes,"
                + " %d warm-up + %d measured runs, medians%n", n, NAMES.length, warm, reps);
        System.out.printf("JVM: %s %s, max heap %d MB%n%n", System.getProperty("java.vm.name"),
                System.getProperty("java.version"), Runtime.getRuntime().maxMemory() >> 20);

        heapPerInstance(n);

        Replica replica = build(n, values(n, 42));
        String xml = replica.getXml(true);
        byte[] xmlBytes = xml.getBytes(StandardCharsets.UTF_8);
        double mb = xmlBytes.length / 1e6;

        // The two are measured in turns, so that both see the same load; the ratio is the median of
        // the ratios of each turn.
        double[] paired = pairedMedians(reps, warm, () -> staxPass(xml), () -> Replica.readFromXmlString(xml));
        double stax = paired[0];
        double xmlRead = paired[1];
        double xmlWrite = median(reps, warm, () -> replica.getXml(true));
        byte[] bin = Replica.getBinaryFromReplica(replica, false);
        byte[] packed = Replica.getBinaryFromReplica(replica, true);
        double binRead = median(reps, warm, () -> Replica.getReplicaFromBinary(bin, false));
        double binWrite = median(reps, warm, () -> Replica.getBinaryFromReplica(replica, false));
        double packedRead = median(reps, warm, () -> Replica.getReplicaFromBinary(packed, true));
        double packedWrite = median(reps, warm, () -> Replica.getBinaryFromReplica(replica, true));
        checkSame(replica, Replica.getReplicaFromBinary(bin, false), n);
        checkSame(replica, Replica.readFromXmlString(xml), n);

        System.out.printf("XML document (schema embedded): %.1f MB, read by both passes as one String through a"
                + " StringReader (the form readFromXmlString takes), with the package's StAX factory settings%n", mb);
        System.out.printf("  bare StAX pass       %8.1f ms  %7.1f MB/s%n", stax * 1e3, mb / stax);
        System.out.printf("  XML read             %8.1f ms  %7.1f MB/s%n", xmlRead * 1e3, mb / xmlRead);
        System.out.printf("  ratio XML read / bare StAX throughput: %.2f   (target >= 0.5; median of the ratios of"
                + " %d alternating pairs, lowest %.2f, highest %.2f)%n%n", paired[2], reps, paired[3], paired[4]);
        System.out.printf("  XML write            %8.1f ms%n", xmlWrite * 1e3);
        System.out.printf("  binary read          %8.1f ms   XML read / binary read:   %5.1fx (target >= 4)%n",
                binRead * 1e3, xmlRead / binRead);
        System.out.printf("  binary write         %8.1f ms   XML write / binary write: %5.1fx (target >= 4)%n",
                binWrite * 1e3, xmlWrite / binWrite);
        System.out.printf("  compressed read      %8.1f ms   compressed write %8.1f ms%n%n", packedRead * 1e3,
                packedWrite * 1e3);
        System.out.printf("Sizes: XML %d bytes, binary %d bytes, compressed binary %d bytes%n", xmlBytes.length,
                bin.length, packed.length);
        System.out.printf("  binary / XML size:            %.3f   (target <= 0.5)%n", (double) bin.length
                / xmlBytes.length);
        System.out.printf("  compressed binary / XML size: %.3f%n", (double) packed.length / xmlBytes.length);
        files(replica, reps, warm);
    }

    /**
     * Files: the XML file written (streamed) against the same file read back, the read against a
     * bare StAX pass over the file, binary files against XML files, and the memory a write adds.
     */
    private static void files(Replica replica, int reps, int warm) throws IOException {
        Path dir = Files.createTempDirectory("corvexa-bench");
        Path xml = dir.resolve("replica.xml");
        Path bin = dir.resolve("replica.bin");
        try {
            long written = rssGrowth(() -> replica.writeXmlFile(xml.toString(), true, false));
            long held = heldDuring(() -> replica.writeXmlFile(xml.toString(), true, false));
            long heldAsString = heldDuring(() -> sink = replica.getXml(true));
            sink = null;
            double[] paired = pairedMedians(reps, warm, () -> staxFilePass(xml), () -> Replica.readFromXmlFile(
                    xml.toString()));
            double write = median(reps, warm, () -> {
                replica.writeXmlFile(xml.toString(), true, false);
                return xml;
            });
            double binWrite = median(reps, warm, () -> {
                replica.writeBinaryFile(bin.toString(), false);
                return bin;
            });
            double binRead = median(reps, warm, () -> Replica.readBinaryFile(bin.toString()));
            checkSame(replica, Replica.readBinaryFile(bin.toString()), replica.getModels().getItem(CLASS).getInstances()
                    .getCount());
            double mb = Files.size(xml) / 1e6;
            System.out.printf("%nFiles (XML with its schema, %.1f MB; binary %.1f MB, uncompressed):%n", mb,
                    Files.size(bin) / 1e6);
            System.out.printf("  XML file write       %8.1f ms   write / read of the same file: %.2f (target <= 1)%n",
                    write * 1e3, write / paired[1]);
            System.out.printf("  XML file read        %8.1f ms   throughput against a bare StAX pass over the file:"
                    + " %.2f (target >= 0.7)%n", paired[1] * 1e3, paired[2]);
            System.out.printf("  binary file write    %8.1f ms   XML file write / binary file write: %.1fx (target >= 4)%n",
                    binWrite * 1e3, write / binWrite);
            System.out.printf("  binary file read     %8.1f ms   XML file read / binary file read:   %.1fx (target >= 4)%n",
                    binRead * 1e3, paired[1] / binRead);
            System.out.printf("  memory an XML file write holds beyond the replica: %s of heap, sampled after collections"
                    + " during the write (target <= 64 MB; getXml into a String holds %s); resident memory it"
                    + " adds: %s%n", megabytes(held), megabytes(heldAsString), megabytes(written));
        } finally {
            Files.deleteIfExists(xml);
            Files.deleteIfExists(bin);
            Files.deleteIfExists(dir);
        }
    }

    /**
     * How far the process's resident memory rises above where it was while work runs (its peak,
     * reset through /proc/self/clear_refs first); -1 where the system does not tell.
     */
    private static long rssGrowth(Runnable work) {
        gc();
        try {
            Files.writeString(Path.of("/proc/self/clear_refs"), "5");
            long before = status("VmRSS:");
            work.run();
            return status("VmHWM:") - before;
        } catch (IOException | RuntimeException e) {
            work.run();
            return -1;
        }
    }

    /**
     * The most heap that work holds beyond what was in use before, sampled after a collection at
     * its progress reports past each fifth of the work (collections are slow: no more samples).
     */
    private static long heldDuring(Runnable work) {
        long base = usedAfterGc();
        long[] peak = {base, 1};
        Progress.setListener((done, total) -> {
            if (total > 0 && done * 5 >= peak[1] * total && peak[1] < 5) {
                peak[1] = done * 5 / total + 1;
                peak[0] = Math.max(peak[0], usedAfterGc());
            }
            return true;
        });
        try {
            work.run();
        } finally {
            Progress.setListener(null);
        }
        return peak[0] - base;
    }

    /** A field of /proc/self/status in bytes. */
    private static long status(String field) throws IOException {
        for (String line : Files.readAllLines(Path.of("/proc/self/status"))) {
            if (line.startsWith(field)) {
                return Long.parseLong(line.substring(field.length()).trim().split("\\s+")[0]) * 1024;
            }
        }
        throw new IOException(field + " not in /proc/self/status");
    }

    private static String megabytes(long bytes) {
        return bytes < 0 ? "not measured here" : String.format("%.1f MB", bytes / 1e6);
    }

    // ------------------------------------------------------------------ data

    /** The values of n instances, eight per instance in attribute order, in the forms setValue takes. */
    private static Object[] values(int n, long seed) {
        Random rnd = new Random(seed);
        Object[] v = new Object[n * NAMES.length];
        for (int i = 0; i < n; i++) {
            int b = i * NAMES.length;
            v[b] = 1_000_000 + i; // distinct boxes, none from the small-integer cache
            v[b + 1] = 1000 + rnd.nextInt(1_000_000);
            v[b + 2] = rnd.nextDouble() * 1000;
            v[b + 3] = (double) rnd.nextInt(100_000) / 8;
            v[b + 4] = "item-" + i;
            v[b + 5] = "note " + Long.toString(rnd.nextLong() & Long.MAX_VALUE, 36);
            v[b + 6] = new Date(1_600_000_000_000L + rnd.nextInt(Integer.MAX_VALUE) * 17L);
            v[b + 7] = rnd.nextBoolean();
        }
        return v;
    }

    private static Replica build(int n, Object[] values) {
        Replica r = new Replica("bench");
        ClassDef c = new ClassDef(CLASS);
        for (int k = 0; k < NAMES.length; k++) {
            c.getAttributes().add(new AttributeDef(NAMES[k], TYPES[k]));
        }
        Model m = new Model(c);
        r.getModels().add(m);
        for (int i = 0; i < n; i++) {
            Instance x = m.createInstance();
            for (int k = 0; k < NAMES.length; k++) {
                x.setValue(k, values[i * NAMES.length + k]);
            }
        }
        r.commit();
        return r;
    }

    /** Compares a replica read back with the original (counts and the values of a sample), so no timing measures a failure. */
    private static void checkSame(Replica a, Replica b, int n) {
        Model ma = a.getModels().getItem(CLASS);
        Model mb = b.getModels().getItem(CLASS);
        if (mb.getInstances().getCount() != n) {
            throw new IllegalStateException("read back " + mb.getInstances().getCount() + " instances, not " + n);
        }
        for (int i = 0; i < n; i += Math.max(1, n / 997)) {
            for (int k = 0; k < NAMES.length; k++) {
                Object x = ma.getInstances().getItem(i).getValue(k);
                Object y = mb.getInstances().getItem(i).getValue(k);
                if (!x.equals(y)) {
                    throw new IllegalStateException("instance " + i + ", " + NAMES[k] + ": " + x + " read back as " + y);
                }
            }
        }
    }

    // ------------------------------------------------------------------ baseline

    /**
     * Walks every event of the document and touches each text, with the JDK's StAX factory set as
     * the package sets it (a new factory per document, as the package makes one per read).
     */
    private static long staxPass(String xml) {
        return staxPass(new StringReader(xml), null);
    }

    /** The same pass over a file, read as the package reads files (a buffered stream, its encoding from the document). */
    private static long staxFilePass(Path file) {
        try (InputStream in = new BufferedInputStream(Files.newInputStream(file), 1 << 16)) {
            return staxPass(null, in);
        } catch (IOException e) {
            throw new UncheckedIOException(e);
        }
    }

    private static long staxPass(Reader reader, InputStream stream) {
        XMLInputFactory f = XMLInputFactory.newDefaultFactory();
        f.setProperty(XMLInputFactory.SUPPORT_DTD, Boolean.FALSE);
        f.setProperty(XMLInputFactory.IS_SUPPORTING_EXTERNAL_ENTITIES, Boolean.FALSE);
        f.setProperty(XMLInputFactory.IS_REPLACING_ENTITY_REFERENCES, Boolean.FALSE);
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
        f.setXMLResolver((publicId, systemId, base, namespace) -> {
            throw new XMLStreamException("external resource '" + systemId + "' refused");
        });
        long sum = 0;
        try {
            XMLStreamReader r = reader != null ? f.createXMLStreamReader(reader) : f.createXMLStreamReader(stream);
            while (r.hasNext()) {
                int e = r.next();
                if (e == XMLStreamReader.CHARACTERS) {
                    sum += r.getTextLength();
                } else if (e == XMLStreamReader.START_ELEMENT) {
                    sum += r.getAttributeCount();
                }
            }
            r.close();
        } catch (XMLStreamException e) {
            throw new IllegalStateException(e);
        }
        return sum;
    }

    // ------------------------------------------------------------------ timing

    private static volatile Object sink;

    /** Median seconds of {@code reps} runs after {@code warm} unmeasured ones. */
    private static double median(int reps, int warm, Supplier<Object> work) {
        for (int i = 0; i < warm; i++) {
            sink = work.get();
        }
        double[] t = new double[reps];
        for (int i = 0; i < reps; i++) {
            t[i] = timeOnce(work);
        }
        sink = null;
        return median(t);
    }

    /**
     * Runs {@code a} and {@code b} in turns ({@code warm} unmeasured pairs, then {@code reps}
     * measured ones). Returns the median seconds of a and of b, then the median, lowest and
     * highest throughput ratio of the pairs (the time of a over the time of b).
     */
    private static double[] pairedMedians(int reps, int warm, Supplier<Object> a, Supplier<Object> b) {
        for (int i = 0; i < warm; i++) {
            sink = a.get();
            sink = b.get();
        }
        double[] ta = new double[reps];
        double[] tb = new double[reps];
        double[] ratio = new double[reps];
        for (int i = 0; i < reps; i++) {
            ta[i] = timeOnce(a);
            tb[i] = timeOnce(b);
            ratio[i] = ta[i] / tb[i];
        }
        sink = null;
        Arrays.sort(ratio);
        return new double[] {median(ta), median(tb), median(ratio), ratio[0], ratio[reps - 1]};
    }

    private static double timeOnce(Supplier<Object> work) {
        sink = null;
        gc();
        long start = System.nanoTime();
        sink = work.get();
        return (System.nanoTime() - start) / 1e9;
    }

    private static double median(double[] values) {
        double[] t = values.clone();
        Arrays.sort(t);
        int n = t.length;
        return n % 2 == 1 ? t[n / 2] : (t[n / 2 - 1] + t[n / 2]) / 2;
    }

    // ------------------------------------------------------------------ heap

    private static long usedAfterGc() {
        long best = Long.MAX_VALUE;
        for (int i = 0; i < 4; i++) {
            gc();
            Runtime rt = Runtime.getRuntime();
            best = Math.min(best, rt.totalMemory() - rt.freeMemory());
        }
        return best;
    }

    private static void gc() {
        System.gc();
        try {
            Thread.sleep(20);
        } catch (InterruptedException e) {
            Thread.currentThread().interrupt();
        }
    }

    /**
     * Heap per instance beyond the values' own objects. Measured as differences of the heap in use
     * after GC, all in this run:
     * <ol>
     * <li>{@code values}: the value objects alone, in the forms the replica stores (a boxed Integer,
     * Double or Boolean, the String, and a Long of milliseconds for a Date), held by one flat array
     * whose own size (a header and a 4-byte slot per value, or 8 without compressed references) is
     * subtracted;</li>
     * <li>{@code replica}: a replica built from those very objects (it keeps the boxes and strings
     * it is given and makes a Long per Date, the same size as the one in step 1), after the flat
     * array is dropped.</li>
     * </ol>
     * {@code (replica - values) / n} is then what the replica adds per instance: the instance
     * object, its value array, its place in the model's list and anything else the package keeps.
     */
    private static void heapPerInstance(int n) {
        long empty = usedAfterGc();
        Object[] stored = values(n, 7);
        for (int i = 6; i < stored.length; i += NAMES.length) {
            stored[i] = ((Date) stored[i]).getTime(); // the stored form of a Date
        }
        long withValues = usedAfterGc();
        long slot = slotBytes();
        long valueBytes = withValues - empty - (16 + slot * stored.length);
        Object[] given = stored.clone();
        for (int i = 6; i < given.length; i += NAMES.length) {
            given[i] = new Date((Long) given[i]);
        }
        Replica r = build(n, given);
        given = null;
        stored = null;
        long withReplica = usedAfterGc();
        sink = r;
        double per = (double) (withReplica - empty - valueBytes) / n;
        System.out.printf("Heap: the values' own objects %.1f bytes per instance; the replica %.1f bytes per"
                + " instance with them%n", (double) valueBytes / n, (double) (withReplica - empty) / n);
        System.out.printf("  heap per instance beyond its values: %.1f bytes   (target <= 200)%n%n", per);
        sink = null;
        if (r.getModels().getItem(CLASS).getInstances().getCount() != n) {
            throw new IllegalStateException("the replica lost instances");
        }
    }

    /** Bytes of one reference in an object array, from the heap that a large array occupies. */
    private static long slotBytes() {
        long before = usedAfterGc();
        Object[] probe = new Object[1 << 22];
        long after = usedAfterGc();
        sink = probe;
        long bytes = Math.round((double) (after - before) / probe.length);
        sink = null;
        return bytes == 8 ? 8 : 4;
    }
}
