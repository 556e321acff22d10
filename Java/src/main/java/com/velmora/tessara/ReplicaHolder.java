package com.velmora.tessara;

import com.velmora.tessara.kdmreplica.Replica;

/**
 * Holds one replica, so that native code called from Java can hand a replica back through an
 * argument. Thread-safe: the held reference is volatile. A new holder holds nothing (null).
 */
public class ReplicaHolder {
    private volatile Replica value;

    /** A holder that holds nothing. */
    public ReplicaHolder() {
    }

    /** A holder of the given replica (null allowed). */
    public ReplicaHolder(Replica value) {
        this.value = value;
    }

    /** The held replica, or null. */
    public Replica getValue() {
        return value;
    }

    /** Holds the given replica (null empties the holder). */
    public void setValue(Replica value) {
        this.value = value;
    }

    @Override
    public String toString() {
        Replica r = value;
        return "ReplicaHolder[" + (r == null ? "empty" : r.toString()) + "]";
    }
}
