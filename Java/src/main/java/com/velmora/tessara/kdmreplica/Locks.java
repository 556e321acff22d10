package com.velmora.tessara.kdmreplica;

import java.util.concurrent.locks.Lock;
import java.util.concurrent.locks.ReentrantReadWriteLock;

/**
 * Lock domains. Every object of a replica (its model set, models, class and attribute
 * definitions, instances and their sets) is guarded by the replica's one read-write lock.
 * Objects that belong to no replica (a class definition whose model was never added, an attribute
 * definition not in any class, a model not in a model set, a detached instance) share one
 * process-wide lock, {@link #FREE}.
 *
 * <p>An object's domain can change (a free model joins a replica), so a lock is taken, then the
 * domain is read again; when it moved, the lock is released and the new one taken. A domain
 * changes only while both the old and the new domain are write-locked.
 *
 * <p>Order: a replica's lock is always taken before {@link #FREE}, never after it, and no
 * operation takes the locks of two replicas. An operation that adopts a free object (adding a free
 * model to a replica, a free attribute to a class) write-locks its own domain, then {@code FREE},
 * and checks under {@code FREE} that the object is still free.
 */
final class Locks {
    static final ReentrantReadWriteLock FREE = new ReentrantReadWriteLock();

    private Locks() {
    }

    static ReentrantReadWriteLock domainOf(Object o) {
        if (o instanceof Instance) {
            Model m = ((Instance) o).model;
            return m == null ? FREE : domainOf(m);
        }
        if (o instanceof Model) {
            Replica r = ((Model) o).replica;
            return r == null ? FREE : r.rw;
        }
        if (o instanceof InstanceSet) {
            return domainOf(((InstanceSet) o).model);
        }
        if (o instanceof AttributeDef) {
            ClassDef c = ((AttributeDef) o).owner;
            return c == null ? FREE : domainOf(c);
        }
        if (o instanceof ClassDef) {
            Replica r = ((ClassDef) o).replica;
            return r == null ? FREE : r.rw;
        }
        if (o instanceof AttributeDefList) {
            return domainOf(((AttributeDefList) o).owner);
        }
        if (o instanceof ModelSet) {
            return ((ModelSet) o).replica.rw;
        }
        if (o instanceof Replica) {
            return ((Replica) o).rw;
        }
        throw new IllegalArgumentException("no lock domain for " + o);
    }

    static Lock read(Object o) {
        for (;;) {
            ReentrantReadWriteLock d = domainOf(o);
            Lock l = d.readLock();
            l.lock();
            if (domainOf(o) == d) {
                return l;
            }
            l.unlock();
        }
    }

    static Lock write(Object o) {
        for (;;) {
            ReentrantReadWriteLock d = domainOf(o);
            Lock l = d.writeLock();
            l.lock();
            if (domainOf(o) == d) {
                return l;
            }
            l.unlock();
        }
    }

    /** Takes the free lock for writing, after the caller's own domain lock. */
    static Lock adopt() {
        Lock l = FREE.writeLock();
        l.lock();
        return l;
    }
}
