package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Set;
import java.util.concurrent.locks.Lock;

/**
 * The live instances of one model, in creation order; positions from 0. Removing an instance marks
 * it deleted (a created instance that was never committed simply disappears) and also removes the
 * instances it holds through {@code Composition} relationships, in whatever model they are.
 */
public class InstanceSet {
    private static final Instance[] NONE = new Instance[0];

    final Model model;
    Instance[] items = NONE;
    int count;

    InstanceSet(Model model) {
        this.model = model;
    }

    /** The set of a new model of a new class, in no replica: it stays empty. */
    public InstanceSet() {
        this.model = new Model(new ClassDef(), this);
    }

    private String who() {
        return "instance set of class '" + model.classDef.name + "'";
    }

    /** Makes room for {@code extra} more instances at once. */
    void reserve(int extra) {
        if (count + extra > items.length) {
            items = Arrays.copyOf(items, Math.max(8, count + extra));
        }
    }

    void append(Instance x) {
        if (count == items.length) {
            items = Arrays.copyOf(items, Math.max(8, count + (count >> 1)));
        }
        x.pos = count;
        items[count++] = x;
    }

    /**
     * Takes out every instance of {@code gone} (all of this set) in one pass from the first of
     * them; the following instances move up (caller holds the write lock).
     */
    void compact(Set<Instance> gone) {
        int first = count;
        for (Instance x : gone) {
            first = Math.min(first, x.pos);
        }
        int w = first;
        for (int r = first; r < count; r++) {
            Instance x = items[r];
            if (gone.contains(x)) {
                x.pos = -1;
            } else {
                x.pos = w;
                items[w++] = x;
            }
        }
        Arrays.fill(items, w, count, null);
        count = w;
    }

    List<Instance> snapshot() {
        return new ArrayList<>(Arrays.asList(items).subList(0, count));
    }

    public int getCount() {
        Lock l = Locks.read(this);
        try {
            return count;
        } finally {
            l.unlock();
        }
    }

    private void checkPosition(int position) {
        if (position < 0 || position >= count) {
            throw new IndexOutOfBoundsException(who() + ": position " + position + " is out of range (count "
                    + count + ")");
        }
    }

    /** @throws IndexOutOfBoundsException */
    public Instance getItem(int position) {
        Lock l = Locks.read(this);
        try {
            checkPosition(position);
            return items[position];
        } finally {
            l.unlock();
        }
    }

    /** Position of the instance, or -1 when it is not in this set. */
    public int indexOf(Instance x) {
        if (x == null) {
            throw new IllegalArgumentException(who() + ": instance is null");
        }
        Lock l = Locks.read(this);
        try {
            int p = x.pos;
            return x.model == model && p >= 0 && p < count && items[p] == x ? p : -1;
        } finally {
            l.unlock();
        }
    }

    private void removeAll(List<Instance> roots) {
        Replica r = model.replica;
        if (r != null) {
            r.removeInstances(roots);
        }
    }

    /** Removes the instance at a position (see the class comment). @throws IndexOutOfBoundsException */
    public void remove(int position) {
        Lock l = Locks.write(this);
        try {
            checkPosition(position);
            removeAll(List.of(items[position]));
        } finally {
            l.unlock();
        }
    }

    /** Removes the instance. @throws IllegalArgumentException when it is not in this set */
    public void remove(Instance x) {
        if (x == null) {
            throw new IllegalArgumentException(who() + ": instance is null");
        }
        Lock l = Locks.write(this);
        try {
            int p = x.pos;
            if (x.model != model || p < 0 || p >= count || items[p] != x) {
                throw new IllegalArgumentException(who() + ": " + x.describe() + " is not in this set");
            }
            removeAll(List.of(x));
        } finally {
            l.unlock();
        }
    }

    /** Removes every instance of the set (and what they hold by composition). */
    public void removeAll() {
        Lock l = Locks.write(this);
        try {
            removeAll(snapshot());
        } finally {
            l.unlock();
        }
    }

    /** For example {@code InstanceSet of 'Part' (12 instances)}. */
    @Override
    public String toString() {
        Lock l = Locks.read(this);
        try {
            return "InstanceSet of '" + model.classDef.name + "' (" + count + " instances)";
        } finally {
            l.unlock();
        }
    }
}
