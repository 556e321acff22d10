package com.velmora.tessara.kdmreplica;

/**
 * Progress of the calling thread's long operations, and their stop. A listener set on a thread
 * hears the work done and the total (bytes or characters read, instances or classes written) of
 * each XML, XSD and binary read and write and each populate that thread runs: at most about ten
 * times a second, and once at the end with the total. Figures grow, never shrink. A listener
 * answering false stops the operation, which then fails with {@link Stopped}: a stopped read or
 * populate leaves the replica as it was, a stopped file write leaves no file (and the file that
 * was there before, if any, as it was).
 */
public final class Progress {
    /** Hears an operation's progress; answers false to stop it. */
    public interface Listener {
        boolean progress(long done, long total);
    }

    /** The failure of an operation that the listener stopped. */
    public static final class Stopped extends RuntimeException {
        private static final long serialVersionUID = 1L;

        Stopped(long done, long total) {
            super("stopped by the progress handler at " + done + " of " + total);
        }
    }

    /** Least time between two reports, in nanoseconds (tests make it 0). */
    static volatile long interval = 100_000_000L;

    private static final ThreadLocal<Listener> LISTENER = new ThreadLocal<>();

    /** Reports nothing: the tracker of a thread without a listener. */
    private static final Tracker NONE = new Tracker(null, 0);

    private Progress() {
    }

    /** Sets the calling thread's listener (null removes it). */
    public static void setListener(Listener listener) {
        if (listener == null) {
            LISTENER.remove();
        } else {
            LISTENER.set(listener);
        }
    }

    /** The calling thread's listener, or null. */
    public static Listener getListener() {
        return LISTENER.get();
    }

    /**
     * Sets the calling thread's listener to a native function {@code function(done, total,
     * context)} (0 removes the listener), for the native bridge.
     */
    public static void setNative(long function, long context) {
        setListener(function == 0 ? null : (done, total) -> callNative(function, context, done, total));
    }

    /** Calls the native function; registered by the native bridge when it starts. */
    private static native boolean callNative(long function, long context, long done, long total);

    /** A tracker for an operation of the calling thread whose work totals {@code total}. */
    static Tracker start(long total) {
        Listener l = LISTENER.get();
        return l == null ? NONE : new Tracker(l, Math.max(0, total));
    }

    /** One operation's reports. */
    static final class Tracker {
        private final Listener listener;
        private final long total;
        private long reported = -1;
        private long last = System.nanoTime();

        private Tracker(Listener listener, long total) {
            this.listener = listener;
            this.total = total;
        }

        /** The work done so far: reported when the last report is old enough. */
        void at(long done) {
            if (listener != null && Math.min(done, total) > reported && System.nanoTime() - last >= interval) {
                report(Math.min(done, total));
            }
        }

        /** The operation's work is done: the last report, with the total. */
        void end() {
            if (listener != null && reported != total) {
                report(total);
            }
        }

        private void report(long done) {
            last = System.nanoTime();
            reported = done;
            if (!listener.progress(done, total)) {
                throw new Stopped(done, total);
            }
        }
    }
}
