package com.velmora.tessara.kdmreplica;

import java.util.List;
import java.util.concurrent.atomic.AtomicLong;

/** Name rules and generated names. */
final class Names {
    private static final AtomicLong COUNTER = new AtomicLong();

    private Names() {
    }

    /** A fresh name: prefix followed by a process-wide counter ("Class7", "attribute12"). */
    static String generate(String prefix) {
        return prefix + COUNTER.incrementAndGet();
    }

    /**
     * Class and attribute names: a letter or '_' first, then letters, digits, '_' or '-'. They are
     * used as element names in documents and joined as "Class.attribute", so '.' is excluded.
     */
    static String checkName(String what, String name) {
        if (name == null) {
            throw new IllegalArgumentException(what + ": name is null");
        }
        if (name.isEmpty()) {
            throw new IllegalArgumentException(what + ": name is empty");
        }
        for (int i = 0; i < name.length(); ) {
            int cp = name.codePointAt(i);
            boolean ok = i == 0 ? (Character.isLetter(cp) || cp == '_')
                    : (Character.isLetterOrDigit(cp) || cp == '_' || cp == '-');
            if (!ok) {
                throw new IllegalArgumentException(what + ": name '" + name + "' is not a valid name"
                        + " (character " + (i + 1) + " '" + new String(Character.toChars(cp))
                        + "'; use a letter or '_' first, then letters, digits, '_' or '-')");
            }
            i += Character.charCount(cp);
        }
        return name;
    }

    static String orEmpty(String s) {
        return s == null ? "" : s;
    }

    static String[] copyStrings(String what, String[] values) {
        if (values == null) {
            return new String[0];
        }
        String[] copy = values.clone();
        for (int i = 0; i < copy.length; i++) {
            if (copy[i] == null) {
                throw new IllegalArgumentException(what + ": element " + i + " is null");
            }
        }
        return copy;
    }

    /** Names joined by " -> " for a message; past ten, the middle is left out and counted. */
    static String chain(List<String> names) {
        int n = names.size();
        if (n <= 10) {
            return String.join(" -> ", names);
        }
        return String.join(" -> ", names.subList(0, 5)) + " -> ... (" + (n - 8) + " more) -> "
                + String.join(" -> ", names.subList(n - 3, n));
    }
}
