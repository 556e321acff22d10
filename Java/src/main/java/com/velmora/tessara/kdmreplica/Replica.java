package com.velmora.tessara.kdmreplica;

import java.util.ArrayDeque;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Collections;
import java.util.HashMap;
import java.util.IdentityHashMap;
import java.util.LinkedHashMap;
import java.util.List;
import java.util.Map;
import java.util.Set;
import java.util.concurrent.locks.Lock;
import java.util.concurrent.locks.ReentrantReadWriteLock;
import java.util.function.Function;

/**
 * A replica: a schema (the class definitions of its models, one model per class) and the data of
 * that schema. All objects of a replica are guarded by the replica's one read-write lock: readers
 * run in parallel, writers exclusively; any thread may call any member.
 *
 * <p>{@link #commit()} checks the whole replica and either refuses with one
 * {@link ReplicaCommitException} listing the violations, changing nothing, or forgets the deleted
 * instances and clears the created and modified flags.
 *
 * <p>Process-wide settings: {@link #setFeature}, {@link #setLimit}, {@link #setSchemaLocation} and
 * {@link #setSchemaFolder}.
 *
 * <p>Files: a relative path given to a member is taken from the process's current directory at
 * the time of the call, so it follows a change of directory by native code. Only regular files are read: a directory, pipe
 * or device is refused unopened.
 */
public class Replica {
    /** Most violations listed by one refused commit; the count of the others is given. */
    public static final int MAX_LISTED_VIOLATIONS = 100;

    private static final Map<String, Boolean> FEATURE_DEFAULTS;
    private static final Map<String, Boolean> FEATURES = Collections.synchronizedMap(new LinkedHashMap<>());
    /** The process-wide schema location (read by the XML writer). */
    static volatile String processSchemaLocation = "";
    /** The folder schema locations may also be read from ({@link #setSchemaFolder}), or "". */
    static volatile String schemaFolder = "";

    static {
        LinkedHashMap<String, Boolean> d = new LinkedHashMap<>();
        d.put("validate", Boolean.FALSE);
        d.put("indent", Boolean.TRUE);
        FEATURE_DEFAULTS = Collections.unmodifiableMap(d);
        FEATURES.putAll(d);
    }

    final ReentrantReadWriteLock rw = new ReentrantReadWriteLock();
    volatile String name;
    final ModelSet models;
    volatile String schemaLocation;

    /**
     * An empty replica named {@code name} (any text but null). Its schema location is the
     * process-wide one in force now.
     */
    public Replica(String name) {
        if (name == null) {
            throw new IllegalArgumentException("Replica: name is null");
        }
        this.name = name;
        this.models = new ModelSet(this);
        this.schemaLocation = processSchemaLocation;
    }

    /** An empty replica with a generated name ("Replica" followed by a number). */
    public Replica() {
        this(Names.generate("Replica"));
    }

    /** The replica of a model set made with {@code new ModelSet()}. */
    Replica(String name, ModelSet set) {
        this.name = name;
        this.models = set;
        this.schemaLocation = processSchemaLocation;
    }

    // ---------------------------------------------------------------- process-wide settings

    /**
     * Sets a process-wide feature. Known features: "validate" (validate XML input against the
     * replica's schema; default off) and "indent" (indent XML output; default on).
     *
     * @throws IllegalArgumentException for an unknown name, listing the known ones
     */
    public static void setFeature(String feature, boolean value) {
        if (feature == null || !FEATURE_DEFAULTS.containsKey(feature)) {
            throw new IllegalArgumentException("Replica.setFeature: unknown feature "
                    + (feature == null ? "null" : "'" + feature + "'") + "; known features: "
                    + String.join(", ", FEATURE_DEFAULTS.keySet()));
        }
        FEATURES.put(feature, value);
    }

    /** The current value of a process-wide feature. @throws IllegalArgumentException for an unknown name */
    public static boolean getFeature(String feature) {
        Boolean v = feature == null ? null : FEATURES.get(feature);
        if (v == null) {
            throw new IllegalArgumentException("Replica.getFeature: unknown feature "
                    + (feature == null ? "null" : "'" + feature + "'") + "; known features: "
                    + String.join(", ", FEATURE_DEFAULTS.keySet()));
        }
        return v;
    }

    /**
     * Sets a process-wide limit on what reading a document may cost; each refusal names the limit.
     * Known limits and defaults: "maxDocumentSize" (bytes of an XML or XSD file, characters of a
     * string; 1 GiB), "maxElementDepth" (256), "maxNamespaceDeclarations" (on one element; 100),
     * "maxAttributeLength" (characters of one attribute value as written; 1 Mi), "maxTextLength"
     * (characters of one text between tags as written; 256 Mi), "maxInflatedSize" (bytes a
     * compressed binary replica may inflate to; 1 GiB) and "maxInflateRatio" (times its compressed
     * size, checked only past 64 MiB; 200). A limit applies to reads that start after it is set.
     *
     * @throws IllegalArgumentException for an unknown name (listing the known ones) or a value below 1
     */
    public static void setLimit(String limit, long value) {
        Limits.set(limit, value);
    }

    /** The current value of a process-wide limit. @throws IllegalArgumentException for an unknown name */
    public static long getLimit(String limit) {
        return Limits.get(limit);
    }

    /**
     * Sets the process-wide folder from which the schema location of a document may also be read:
     * a document given as a string reads its schema file only from there (relative locations are
     * taken from it), a document file from its own folder or there. Null or "" (the default): a
     * string document reads no schema file, a document file only from its own folder.
     */
    public static void setSchemaFolder(String folder) {
        schemaFolder = Names.orEmpty(folder).isEmpty() ? "" : XmlInput.callerPath(folder).toString();
    }

    /** The folder set by {@link #setSchemaFolder} (absolute), or "". */
    public static String getSchemaFolder() {
        return schemaFolder;
    }

    /** Sets the process-wide schema location written into XML output (null: none, stored as ""). */
    public static void setSchemaLocation(String location) {
        processSchemaLocation = Names.orEmpty(location);
    }

    /** The location this replica was read with, or the process-wide one in force when it was created. */
    public String getSchemaLocation() {
        return schemaLocation;
    }

    // ---------------------------------------------------------------- name, schema, lookups

    public String getName() {
        return name;
    }

    /** @throws IllegalArgumentException for null */
    public void setName(String name) {
        if (name == null) {
            throw new IllegalArgumentException("replica '" + this.name + "': name is null");
        }
        Lock l = rw.writeLock();
        l.lock();
        try {
            this.name = name;
        } finally {
            l.unlock();
        }
    }

    /** The replica's own model set (live). */
    public ModelSet getModels() {
        return models;
    }

    /**
     * The live instance whose identifier is {@code id} (a String, or a byte[] by content), looked
     * up in each model's identifier index in model order (identifiers are unique within a model,
     * so the first model holding it wins); null when none has it.
     *
     * @throws IllegalArgumentException for null or another kind of identifier
     */
    public Instance findInstance(Object id) {
        Object key = Model.lookupKey(id, "replica '" + name + "'");
        Lock l = rw.readLock();
        l.lock();
        try {
            for (Model m : models.items) {
                Instance x = m.ids == null ? null : m.ids.get(key);
                if (x != null) {
                    return x;
                }
            }
            return null;
        } finally {
            l.unlock();
        }
    }

    /** The class of that name, or null. */
    public ClassDef getClassDef(String className) {
        if (className == null) {
            throw new IllegalArgumentException("replica '" + name + "': class name is null");
        }
        Lock l = rw.readLock();
        l.lock();
        try {
            Model m = models.byName.get(className);
            return m == null ? null : m.classDef;
        } finally {
            l.unlock();
        }
    }

    /**
     * An attribute definition by "Class.attribute" (inherited attributes included) or by a bare
     * name that exactly one class of the replica holds as its own; null when none matches.
     *
     * @throws IllegalArgumentException for null, or a bare name that several classes hold (naming them)
     */
    public AttributeDef getAttributeDef(String attributeName) {
        if (attributeName == null) {
            throw new IllegalArgumentException("replica '" + name + "': attribute name is null");
        }
        Lock l = rw.readLock();
        l.lock();
        try {
            int dot = attributeName.indexOf('.');
            if (dot >= 0) {
                Model m = models.byName.get(attributeName.substring(0, dot));
                if (m == null) {
                    return null;
                }
                int p = m.classDef.positionOf(attributeName.substring(dot + 1));
                return p < 0 ? null : m.classDef.layout[p];
            }
            AttributeDef found = null;
            List<String> holders = new ArrayList<>();
            for (Model m : models.items) {
                for (AttributeDef a : m.classDef.attributes.items) {
                    if (a.name.equals(attributeName)) {
                        found = a;
                        holders.add("'" + m.classDef.name + "'");
                    }
                }
            }
            if (holders.size() > 1) {
                throw new IllegalArgumentException("replica '" + name + "': attribute name '" + attributeName
                        + "' is ambiguous: classes " + String.join(", ", holders)
                        + " hold it; write 'Class." + attributeName + "'");
            }
            return found;
        } finally {
            l.unlock();
        }
    }

    /** Recomputes and installs every layout (caller holds the write lock). @throws IllegalArgumentException */
    void schemaChanged() {
        schemaChanged(null);
    }

    /**
     * As {@link #schemaChanged()}; {@code reparented}, when not null, is a class whose super class
     * changed: the change is refused, before any layout is installed, when a stored reference would
     * then no longer be of a target class of its attribute.
     *
     * @throws IllegalStateException for such a reference, naming it
     */
    void schemaChanged(ClassDef reparented) {
        Map<ClassDef, AttributeDef[]> layouts = Schema.compute(this);
        if (reparented != null) {
            for (Model m : models.items) {
                for (AttributeDef a : m.classDef.attributes.items) {
                    String[] targets = a.targetNames;
                    String bad = a.type != AttributeType.Relationship || targets.length == 0 ? null
                            : objection(a, layouts, v -> refusedTarget(targets, v));
                    if (bad != null) {
                        throw new IllegalStateException("class '" + reparented.name + "' cannot "
                                + (reparented.superName.isEmpty() ? "leave its super class"
                                        : "take the super class '" + reparented.superName + "'")
                                + ": through attribute '" + a.qualifiedName() + "', " + bad);
                    }
                }
            }
        }
        Schema.apply(this, layouts);
    }

    /**
     * The first stored value of {@code a} that {@code objection} objects to, as "instance X" and
     * the objection, or null: values of live instances, then of deleted ones that the next commit
     * forgets (caller holds a lock). With {@code layouts}, values that those layouts of their
     * class no longer hold are passed over.
     */
    String objection(AttributeDef a, Map<ClassDef, AttributeDef[]> layouts, Function<Object, String> objection) {
        for (Model m : models.items) {
            int p = Arrays.asList(m.alignedTo).indexOf(a);
            if (p < 0 || layouts != null && !Arrays.asList(layouts.get(m.classDef)).contains(a)) {
                continue;
            }
            int live = m.instances.count;
            for (int k = 0, n = live + (m.deleted == null ? 0 : m.deleted.size()); k < n; k++) {
                Instance x = k < live ? m.instances.items[k] : m.deleted.get(k - live);
                String o = x.values[p] == null ? null : objection.apply(x.values[p]);
                if (o != null) {
                    return "instance " + x.describe() + " " + o;
                }
            }
        }
        return null;
    }

    /**
     * For a stored relationship value: the first target of this replica that {@code targets}
     * do not allow, described; or null (caller holds a lock).
     */
    String refusedTarget(String[] targets, Object stored) {
        for (Instance t : Values.targets(stored)) {
            Model tm = t.model;
            if (tm != null && tm.replica == this && !Values.isTarget(targets, tm.classDef, models)) {
                return "refers to " + t.describe() + ", of class '" + tm.classDef.name + "', not of a target class "
                        + Arrays.toString(targets);
            }
        }
        return null;
    }

    /** Instances (live or deleted) that hold a value of {@code a} (caller holds a lock). */
    int countValuesOf(AttributeDef a) {
        int n = 0;
        for (Model m : models.items) {
            AttributeDef[] layout = m.alignedTo;
            for (int p = 0; p < layout.length; p++) {
                if (layout[p] == a) {
                    for (int k = 0; k < m.instances.count; k++) {
                        n += m.instances.items[k].values[p] != null ? 1 : 0;
                    }
                    if (m.deleted != null) {
                        for (Instance x : m.deleted) {
                            n += x.values[p] != null ? 1 : 0;
                        }
                    }
                }
            }
        }
        return n;
    }

    boolean isLive(Instance x) {
        return x.model != null && x.model.replica == this && x.pos >= 0 && (x.state & Instance.DELETED) == 0;
    }

    /**
     * Removes live instances and, transitively, the live instances they hold through Composition
     * relationships (caller holds the write lock). Created instances disappear; the others wait in
     * their model's deleted list for the next commit.
     */
    void removeInstances(List<Instance> roots) {
        Set<Instance> gone = Collections.newSetFromMap(new IdentityHashMap<>());
        ArrayDeque<Instance> queue = new ArrayDeque<>();
        for (Instance x : roots) {
            if (isLive(x) && gone.add(x)) {
                queue.add(x);
            }
        }
        while (!queue.isEmpty()) {
            Instance x = queue.poll();
            AttributeDef[] layout = x.model.alignedTo;
            for (int p = 0; p < layout.length; p++) {
                AttributeDef def = layout[p];
                if (def.type == AttributeType.Relationship && def.aggregation == AggregationType.Composition
                        && x.values[p] != null) {
                    for (Instance t : Values.targets(x.values[p])) {
                        if (isLive(t) && gone.add(t)) {
                            queue.add(t);
                        }
                    }
                }
            }
        }
        Map<Model, Set<Instance>> byModel = new IdentityHashMap<>();
        for (Instance x : gone) {
            byModel.computeIfAbsent(x.model, k -> Collections.newSetFromMap(new IdentityHashMap<>())).add(x);
        }
        for (Map.Entry<Model, Set<Instance>> e : byModel.entrySet()) {
            Model m = e.getKey();
            m.instances.compact(e.getValue());
            for (Instance x : e.getValue()) {
                Object key = Instance.keyOf(x.id);
                if (key != null && m.ids != null && m.ids.get(key) == x) {
                    m.ids.remove(key);
                }
                boolean created = (x.state & Instance.CREATED) != 0;
                x.state = Instance.DELETED;
                if (created) {
                    x.forget();
                } else {
                    if (m.deleted == null) {
                        m.deleted = new ArrayList<>();
                    }
                    m.deleted.add(x);
                }
            }
        }
    }

    // ---------------------------------------------------------------- commit

    /**
     * Checks the whole replica: mandatory attributes valuated, unique attributes unique within
     * their class (and its subclasses), no reference to a deleted instance, to one outside the
     * replica or to one not of a target class, no value longer than its attribute's length (a
     * document or binary replica may have loaded one), no live instance of an abstract class. On success forgets the deleted instances and
     * clears every created and modified flag.
     *
     * @throws ReplicaCommitException listing every violation (up to {@link #MAX_LISTED_VIOLATIONS});
     *         nothing is changed then
     */
    public void commit() {
        Lock l = rw.writeLock();
        l.lock();
        try {
            List<String> listed = new ArrayList<>();
            int[] total = {0};
            IdentityHashMap<AttributeDef, HashMap<Object, Instance>> uniques = new IdentityHashMap<>();
            for (Model m : models.items) {
                ClassDef c = m.classDef;
                InstanceSet s = m.instances;
                if (c.abstractClass && s.count > 0) {
                    violation(listed, total, "class '" + c.name + "' is abstract but has " + s.count
                            + " live instance(s)");
                }
                AttributeDef[] layout = m.alignedTo;
                for (int k = 0; k < s.count; k++) {
                    Instance x = s.items[k];
                    for (int p = 0; p < layout.length; p++) {
                        AttributeDef def = layout[p];
                        Object v = x.values[p];
                        if (v == null) {
                            if (def.mandatory) {
                                violation(listed, total, x.describe() + ": mandatory attribute '"
                                        + def.qualifiedName() + "' has no value");
                            }
                            continue;
                        }
                        if (def.type == AttributeType.Relationship) {
                            for (Instance t : Values.targets(v)) {
                                if ((t.state & Instance.DELETED) != 0) {
                                    violation(listed, total, x.describe() + ": attribute '" + def.qualifiedName()
                                            + "' refers to " + t.describe() + ", which is deleted");
                                } else if (t.model == null || t.model.replica != this) {
                                    violation(listed, total, x.describe() + ": attribute '" + def.qualifiedName()
                                            + "' refers to " + t.describe() + ", which is not in the replica");
                                } else if (!Values.isTarget(def.targetNames, t.model.classDef, models)) {
                                    violation(listed, total, x.describe() + ": attribute '" + def.qualifiedName()
                                            + "' refers to " + t.describe() + ", which is not of a target class "
                                            + Arrays.toString(def.targetNames));
                                }
                            }
                        } else if (def.length > 0) {
                            int longest = Values.longest(v);
                            if (longest > def.length) {
                                violation(listed, total, x.describe() + ": attribute '" + def.qualifiedName()
                                        + "' holds at most " + def.length + (def.type == AttributeType.Binary
                                        ? " bytes" : " characters") + " but has a value of " + longest);
                            }
                        }
                        if (def.unique) {
                            Instance other = uniques.computeIfAbsent(def, d -> new HashMap<>()).putIfAbsent(
                                    Values.key(v), x);
                            if (other != null) {
                                StringBuilder b = new StringBuilder("attribute '").append(def.qualifiedName())
                                        .append("' is unique but ").append(other.describe()).append(" and ")
                                        .append(x.describe()).append(" both hold ");
                                Values.format(b, v);
                                violation(listed, total, b.toString());
                            }
                        }
                    }
                }
            }
            if (total[0] > 0) {
                throw new ReplicaCommitException(name, listed, total[0]);
            }
            for (Model m : models.items) {
                InstanceSet s = m.instances;
                for (int k = 0; k < s.count; k++) {
                    s.items[k].state = 0;
                }
                forget(m);
            }
        } finally {
            l.unlock();
        }
    }

    /** Forgets the deleted instances of a model (caller holds the write lock). */
    static void forget(Model m) {
        if (m.deleted != null) {
            for (Instance x : m.deleted) {
                x.forget();
            }
            m.deleted = null;
        }
    }

    private static void violation(List<String> listed, int[] total, String text) {
        if (listed.size() < MAX_LISTED_VIOLATIONS) {
            listed.add(text);
        }
        total[0]++;
    }

    // ---------------------------------------------------------------- documents (not written yet)

    private static UnsupportedOperationException notYet(String member) {
        return new UnsupportedOperationException("Replica." + member + " is not implemented yet");
    }

    /**
     * Adds the classes of a W3C XML Schema (each with an empty model): a schema written by
     * {@link #getXsd()}, or a hand-written one of the same shape (see the package README).
     * A schema given as a string may not include or import other schemas.
     *
     * @throws XmlDocumentException for a construct that is not read, naming it and its line, or a
     *         class the replica already has; the replica is then unchanged
     * @throws IllegalArgumentException for null
     */
    public void insertSchemaString(String xsd) {
        XsdReader.insert(this, XmlInput.Src.ofString("XSD", xsd, "insertSchemaString"));
    }

    /**
     * As {@link #insertSchemaString}, from a file; {@code xs:include} and {@code xs:import} may name
     * local files in the file's directory (or below it), nothing else.
     */
    public void insertSchemaFile(String path) {
        XsdReader.insert(this, XmlInput.Src.ofFile("XSD", path, "insertSchemaFile"));
    }

    /**
     * Adds the instances of a replica document to this replica, whose classes must include the
     * document's; an embedded schema and a schema location are not read. Instances are unchanged
     * unless the document carries states.
     *
     * @throws XmlDocumentException naming the line, column and offending name; the replica is
     *         then unchanged
     * @throws IllegalArgumentException for null
     */
    public void populatesFromXmlString(String xml) {
        XmlReader.populate(this, XmlInput.Src.ofString("XML", xml, "populatesFromXmlString"));
    }

    /** As {@link #populatesFromXmlString}, from a file. */
    public void populatesFromXmlFile(String path) {
        XmlReader.populate(this, XmlInput.Src.ofFile("XML", path, "populatesFromXmlFile"));
    }

    /**
     * A new replica from a document: the schema embedded in it, or else the local schema file its
     * {@code xsi:schemaLocation} names (relative paths from the current directory; URLs are
     * refused). The replica's schema location is the one the document names ("" if none).
     *
     * @throws XmlDocumentException naming the line, column and offending name, or saying that the
     *         document has no schema
     * @throws IllegalArgumentException for null
     */
    public static Replica readFromXmlString(String xml) {
        return XmlReader.read(XmlInput.Src.ofString("XML", xml, "readFromXmlString"));
    }

    /** As {@link #readFromXmlString}, from a file; a relative schema location is taken from the file's directory. */
    public static Replica readFromXmlFile(String path) {
        return XmlReader.read(XmlInput.Src.ofFile("XML", path, "readFromXmlFile"));
    }

    /**
     * The schema as a W3C XML Schema that validates this replica's documents; every class and
     * attribute property travels in its {@code xs:appinfo}, so {@link #insertSchemaString} on an
     * empty replica gives this schema again.
     *
     * @throws IllegalArgumentException for a class or attribute name that cannot be an XML name
     */
    public String getXsd() {
        return XsdWriter.write(this);
    }

    /**
     * The replica as an XML document: {@code withSchema} embeds the schema (so the document reads
     * back on its own), {@code withState} writes the created, modified and deleted states. The
     * process-wide schema location, when set, is written as {@code xsi:schemaLocation}. Every
     * value survives a read exactly; texts that XML cannot carry are escaped reversibly.
     *
     * @throws IllegalArgumentException for a relationship to an instance the document does not
     *         hold (deleted, without {@code withState}), or a name that cannot be an XML name
     */
    public String getXml(boolean withSchema, boolean withState) {
        return XmlWriter.write(this, withSchema, withState);
    }

    /** {@code getXml(withSchema, false)}. */
    public String getXml(boolean withSchema) {
        return getXml(withSchema, false);
    }

    /**
     * The binary form of a replica: schema, instances with identifiers, states and values, deleted
     * instances, name and schema location, with a version and a checksum; deflated when
     * {@code compressed}. Reading it back with {@link #getReplicaFromBinary} gives the same replica.
     *
     * @throws IllegalArgumentException for null, or a replica that holds a reference the form
     *         cannot carry (to an instance of a class no longer in the replica), naming it
     */
    public static byte[] getBinaryFromReplica(Replica replica, boolean compressed) {
        if (replica == null) {
            throw new IllegalArgumentException("Replica.getBinaryFromReplica: replica is null");
        }
        return BinaryCodec.write(replica, compressed);
    }

    /**
     * A new replica from bytes written by {@link #getBinaryFromReplica}; {@code compressed} must
     * match how they were written.
     *
     * @throws ReplicaBinaryException (an IllegalArgumentException) for bytes that are truncated,
     *         corrupted, hostile or read with the wrong flag, saying what and at which offset
     * @throws IllegalArgumentException for null
     */
    public static Replica getReplicaFromBinary(byte[] bytes, boolean compressed) {
        if (bytes == null) {
            throw new IllegalArgumentException("Replica.getReplicaFromBinary: bytes is null");
        }
        return BinaryCodec.read(bytes, compressed);
    }

    /**
     * Writes {@link #getXml(boolean, boolean)}'s document into a file, streamed: the document is
     * never whole in memory. It goes to a temporary file in the same directory, which replaces
     * {@code path} only once complete; a failed or stopped write leaves {@code path} as it was.
     * A relative path is taken from the process's current directory.
     *
     * @throws IllegalArgumentException as {@code getXml} does, or naming the file and the cause
     *         when it cannot be written
     * @throws Progress.Stopped when the thread's progress listener stopped it
     */
    public void writeXmlFile(String path, boolean withSchema, boolean withState) {
        XmlWriter.writeFile(this, OutputFiles.target(path, "writeXmlFile"), withSchema, withState);
    }

    /** Writes {@link #getXsd()}'s schema into a file, as {@link #writeXmlFile} writes. */
    public void writeXsdFile(String path) {
        XsdWriter.writeFile(this, OutputFiles.target(path, "writeXsdFile"));
    }

    /**
     * Writes {@link #getBinaryFromReplica}'s form into a file, as {@link #writeXmlFile} writes:
     * the payload is encoded (and deflated) into the file as it goes, the header last.
     */
    public void writeBinaryFile(String path, boolean compressed) {
        BinaryCodec.writeFile(this, OutputFiles.target(path, "writeBinaryFile"), compressed);
    }

    /**
     * A new replica from a file written by {@link #writeBinaryFile} (or bytes of
     * {@link #getBinaryFromReplica}), compressed or not as its header says.
     *
     * @throws ReplicaBinaryException for bytes that are truncated, corrupted or hostile
     * @throws IllegalArgumentException naming the file and the cause when it cannot be read
     */
    public static Replica readBinaryFile(String path) {
        return BinaryCodec.readFile(OutputFiles.target(path, "readBinaryFile"));
    }

    /** As {@link #getReplicaFromBinary} with the compression its header says. */
    public static Replica getReplicaFromBinary(byte[] bytes) {
        if (bytes == null) {
            throw new IllegalArgumentException("Replica.getReplicaFromBinary: bytes is null");
        }
        return BinaryCodec.read(bytes, null);
    }

    /** The version of the replica package ("0.1.0"); the native library refuses a package of another. */
    public static String getVersion() {
        return Version.get();
    }

    /** For example {@code Replica 'plant' (3 classes, 120 instances, 2 deleted)}. */
    @Override
    public String toString() {
        Lock l = rw.readLock();
        l.lock();
        try {
            int live = 0;
            int deleted = 0;
            for (Model m : models.items) {
                live += m.instances.count;
                deleted += m.deleted == null ? 0 : m.deleted.size();
            }
            return "Replica '" + name + "' (" + models.items.size() + " classes, " + live + " instances"
                    + (deleted > 0 ? ", " + deleted + " deleted" : "") + ")";
        } finally {
            l.unlock();
        }
    }
}
