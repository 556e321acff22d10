/**
 * The replica: schema (class and attribute definitions), data (models, instances, values),
 * states and commit. Positions are 0-based; lookups by name answer null, {@code indexOf} answers
 * -1 when absent; misuse throws an exception whose message names the object and the bad value.
 *
 * <h2>Internal API for the document codecs (package-private)</h2>
 *
 * <p>Codecs (XML reader and writer, XSD reader and writer, binary codec) live in this package and
 * use these package-private members; no reflection, no copies of the data structures.
 *
 * <ul>
 * <li>Locking: {@code replica.rw} is the replica's {@code ReentrantReadWriteLock}. A writer of a
 * document holds its read lock for the whole pass; a reader that changes a replica uses
 * {@code Staging}, which holds the write lock.</li>
 * <li>Schema, in order: {@code replica.models.items} (models in order), {@code model.classDef};
 * a class's {@code name}, {@code superName}, {@code uuid}, {@code comment}, {@code derivability},
 * {@code scopeNames}, {@code extensible}, {@code abstractClass}, {@code persistent},
 * {@code visibility}, {@code classType}, own attributes {@code attributes.items}; an attribute's
 * {@code name}, {@code type}, {@code multi}, {@code length}, {@code mandatory}, {@code unique},
 * {@code accessMode}, {@code visibility}, {@code aggregation}, {@code uuid}, {@code comment},
 * {@code targetNames}, {@code targetRefs}. {@code ModelSet.superOf(c)} resolves a super class.
 * Writers must emit super classes before subclasses or let the reader accept any order (Staging
 * does).</li>
 * <li>Data: {@code model.alignedTo} (equal to {@code classDef.layout}: inherited attributes first)
 * gives the attribute of each position of {@code instance.values}; live instances are
 * {@code model.instances.items[0 .. count)}, deleted ones waiting for commit are
 * {@code model.deleted} (may be null); {@code instance.id} is null, a String or a byte[];
 * {@code instance.state} holds the bits {@code Instance.CREATED}, {@code MODIFIED},
 * {@code DELETED}. Stored value forms are listed in {@code Values}; {@code Values.exportValue}
 * gives the public form, {@code Values.targets} the instances of a relationship value.</li>
 * <li>Building: {@code new Staging(replica)} then {@code addClass(ClassDef)} for each new class
 * (attributes already added through the public list), {@code schemaDone()}, then
 * {@code newInstance(model, id, created, modified, deleted)} and
 * {@code setValue(instance, position, publicForm)} (checked like {@code Instance.setValue}, access
 * mode ignored), then {@code finish()}; {@code close()} (try-with-resources) undoes everything
 * when {@code finish()} was not reached. A reader of a new replica stages into a fresh
 * {@code new Replica(name)} and sets {@code replica.schemaLocation}; {@code populatesFrom*} and
 * {@code insertSchema*} stage into the target itself, so on any error the target is as before
 * and existing objects (their identity matters to native proxies) are never replaced.</li>
 * <li>Features: {@code Replica.getFeature("validate")}, {@code Replica.getFeature("indent")}.</li>
 * </ul>
 *
 * <h2>Locks</h2>
 * One read-write lock per replica guards all its objects (see {@code Locks}); objects in no
 * replica share one process-wide lock. A replica's lock is always taken before that shared one.
 */
package com.velmora.tessara.kdmreplica;
