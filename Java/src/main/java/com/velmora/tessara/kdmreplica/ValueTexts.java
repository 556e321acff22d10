package com.velmora.tessara.kdmreplica;

import java.time.DateTimeException;
import java.time.LocalDateTime;
import java.time.ZoneOffset;
import java.util.Base64;
import java.util.regex.Matcher;
import java.util.regex.Pattern;

/**
 * The text forms of values in documents: Integer, Double (with the decimal reader whose exactness
 * {@link Decimals} decides), Boolean, Binary (base64) and Date (xs:dateTime), each written one
 * way and read from a String or, without making one, from characters.
 */
final class ValueTexts {
    private ValueTexts() {
    }

    static final long CANONICAL_NAN = Double.doubleToRawLongBits(Double.NaN);

    /** Exact text of a double: Java's round-trip form, "INF", "-INF", "NaN" (see {@link #nanBits}). */
    static String formatDouble(double d) {
        if (d == Double.POSITIVE_INFINITY) {
            return "INF";
        }
        if (d == Double.NEGATIVE_INFINITY) {
            return "-INF";
        }
        return Double.toString(d);
    }

    /** The bits of a NaN whose payload is not the canonical one (written beside "NaN"), or null. */
    static String nanBits(double d) {
        long bits = Double.doubleToRawLongBits(d);
        if (d != d && bits != CANONICAL_NAN) {
            String h = Long.toHexString(bits);
            return "0000000000000000".substring(h.length()) + h;
        }
        return null;
    }


    /** Whether {@code t} is a decimal xs:double: [+-]?(d+(.d*)?|.d+)([eE][+-]?d+)? with ASCII digits d. */
    private static boolean isDecimal(String t) {
        int n = t.length();
        int i = 0;
        if (i < n && (t.charAt(i) == '+' || t.charAt(i) == '-')) {
            i++;
        }
        int digits = 0;
        while (i < n && isDigit(t.charAt(i))) {
            i++;
            digits++;
        }
        if (i < n && t.charAt(i) == '.') {
            i++;
            while (i < n && isDigit(t.charAt(i))) {
                i++;
                digits++;
            }
        }
        if (digits == 0) {
            return false;
        }
        if (i < n && (t.charAt(i) == 'e' || t.charAt(i) == 'E')) {
            i++;
            if (i < n && (t.charAt(i) == '+' || t.charAt(i) == '-')) {
                i++;
            }
            int exp = i;
            while (i < n && isDigit(t.charAt(i))) {
                i++;
            }
            if (i == exp) {
                return false;
            }
        }
        return i == n;
    }

    private static boolean isDigit(char c) {
        return c >= '0' && c <= '9';
    }

    /** @throws IllegalArgumentException for a text that is not an xs:double */
    static double parseDouble(String text, String bits) {
        String t = text.strip();
        double d;
        switch (t) {
            case "INF":
            case "+INF":
                d = Double.POSITIVE_INFINITY;
                break;
            case "-INF":
                d = Double.NEGATIVE_INFINITY;
                break;
            case "NaN":
                d = Double.NaN;
                break;
            default:
                if (!isDecimal(t)) {
                    throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is not a Double");
                }
                d = Double.parseDouble(t);
        }
        if (bits != null) {
            long v;
            try {
                v = Long.parseUnsignedLong(bits.strip(), 16);
            } catch (NumberFormatException e) {
                throw new IllegalArgumentException("bits '" + XmlNames.clip(bits) + "' are not 16 hexadecimal digits", e);
            }
            double n = Double.longBitsToDouble(v);
            if (d == d || n == n || bits.strip().length() != 16) {
                throw new IllegalArgumentException("bits '" + XmlNames.clip(bits) + "' are only for a NaN value, given as the"
                        + " 16 hexadecimal digits of a NaN");
            }
            d = n;
        }
        return d;
    }

    /**
     * {@link #parseDouble(String, String)} of the first {@code n} characters of {@code c}: a
     * decimal number without surrounding whitespace or bits is read here, anything else the
     * general way.
     */
    static double parseDouble(char[] c, int n, String bits) {
        if (bits == null) {
            double d = decimal(c, n);
            if (d == d) {
                return d;
            }
        }
        return parseDouble(new String(c, 0, n), bits);
    }

    /**
     * The value of the first {@code n} characters of {@code c} when they are a decimal xs:double
     * (see {@link #isDecimal}) with at most 19 significant digits whose value {@link Decimals}
     * decides; otherwise NaN.
     */
    private static double decimal(char[] c, int n) {
        int i = 0;
        boolean negative = false;
        if (n > 0 && (c[0] == '+' || c[0] == '-')) {
            negative = c[0] == '-';
            i++;
        }
        long w = 0; // the significant digits, unsigned
        int significant = 0;
        int q = 0; // w * 10^q is the value
        boolean anyDigit = false;
        for (boolean fraction = false; i < n; i++) {
            char d = c[i];
            if (isDigit(d)) {
                anyDigit = true;
                if (w != 0 || d != '0') {
                    if (++significant > 19) {
                        return Double.NaN;
                    }
                    w = w * 10 + (d - '0');
                }
                if (fraction) {
                    q--;
                }
            } else if (d == '.' && !fraction) {
                fraction = true;
            } else {
                break;
            }
        }
        if (!anyDigit) {
            return Double.NaN;
        }
        if (i < n && (c[i] == 'e' || c[i] == 'E')) {
            i++;
            boolean negativeExponent = false;
            if (i < n && (c[i] == '+' || c[i] == '-')) {
                negativeExponent = c[i] == '-';
                i++;
            }
            int start = i;
            int e = 0;
            for (; i < n && isDigit(c[i]); i++) {
                if (e < 100_000) { // far beyond any double; the general way reads such exponents
                    e = e * 10 + (c[i] - '0');
                }
            }
            if (i == start) {
                return Double.NaN;
            }
            q += negativeExponent ? -e : e;
        }
        return i == n ? Decimals.toDouble(negative, w, q) : Double.NaN;
    }

    /**
     * {@link #parseInt(String)} of the first {@code n} characters of {@code c}: a sign and up to
     * ten digits are read here, anything else the general way.
     */
    static int parseInt(char[] c, int n) {
        int i = n > 0 && (c[0] == '+' || c[0] == '-') ? 1 : 0;
        if (n - i >= 1 && n - i <= 10) {
            long v = 0;
            for (int k = i; k < n && isDigit(c[k]); k++) {
                v = v * 10 + (c[k] - '0');
                if (k == n - 1) {
                    v = c[0] == '-' ? -v : v;
                    if (v >= Integer.MIN_VALUE && v <= Integer.MAX_VALUE) {
                        return (int) v;
                    }
                }
            }
        }
        return parseInt(new String(c, 0, n));
    }

    /** {@link #parseBoolean(String)} of the first {@code n} characters of {@code c}. */
    static boolean parseBoolean(char[] c, int n) {
        if (n == 1 && (c[0] == '1' || c[0] == '0')) {
            return c[0] == '1';
        }
        if (n == 4 && c[0] == 't' && c[1] == 'r' && c[2] == 'u' && c[3] == 'e') {
            return true;
        }
        if (n == 5 && c[0] == 'f' && c[1] == 'a' && c[2] == 'l' && c[3] == 's' && c[4] == 'e') {
            return false;
        }
        return parseBoolean(new String(c, 0, n));
    }

    /** @throws IllegalArgumentException for a text that is not a 32-bit integer */
    static int parseInt(String text) {
        String t = text.strip();
        int start = t.isEmpty() || t.charAt(0) != '+' && t.charAt(0) != '-' ? 0 : 1;
        boolean digits = start < t.length();
        for (int i = start; i < t.length() && digits; i++) {
            digits = isDigit(t.charAt(i));
        }
        if (digits) {
            try {
                return Integer.parseInt(t.charAt(0) == '+' ? t.substring(1) : t);
            } catch (NumberFormatException e) {
                throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is outside the range of an Integer", e);
            }
        }
        throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is not an Integer");
    }

    /** @throws IllegalArgumentException for a text that is not an xs:boolean */
    static boolean parseBoolean(String text) {
        switch (text.strip()) {
            case "true":
            case "1":
                return true;
            case "false":
            case "0":
                return false;
            default:
                throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is not a Boolean (true, false, 1 or 0)");
        }
    }

    static String formatBinary(byte[] b) {
        return Base64.getEncoder().encodeToString(b);
    }

    /** @throws IllegalArgumentException for a text that is not base64 */
    static byte[] parseBinary(String text) {
        String t = text;
        for (int i = 0; i < t.length(); i++) {
            char c = t.charAt(i);
            if (c == ' ' || c == '\t' || c == '\n' || c == '\r') {
                StringBuilder b = new StringBuilder(t.length());
                for (int k = 0; k < t.length(); k++) {
                    char d = t.charAt(k);
                    if (d != ' ' && d != '\t' && d != '\n' && d != '\r') {
                        b.append(d);
                    }
                }
                t = b.toString();
                break;
            }
        }
        try {
            return Base64.getDecoder().decode(t);
        } catch (IllegalArgumentException e) {
            throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is not base64 binary: " + e.getMessage(), e);
        }
    }

    private static void pad(StringBuilder b, long v, int width) {
        String s = Long.toString(v);
        for (int i = s.length(); i < width; i++) {
            b.append('0');
        }
        b.append(s);
    }

    /**
     * A date (milliseconds since 1970 UTC) as an xs:dateTime in UTC with milliseconds, for example
     * {@code 2024-03-01T12:00:00.250Z}. Years before 1 follow XML Schema 1.0, which has no year
     * zero: the proleptic year 0 is written -0001, year -1 is -0002.
     */
    static String formatDate(long millis) {
        long seconds = Math.floorDiv(millis, 1000L);
        int ms = (int) Math.floorMod(millis, 1000L);
        LocalDateTime t = LocalDateTime.ofEpochSecond(seconds, 0, ZoneOffset.UTC);
        long year = t.getYear();
        StringBuilder b = new StringBuilder(24);
        if (year <= 0) {
            b.append('-');
            pad(b, 1 - year, 4);
        } else {
            pad(b, year, 4);
        }
        b.append('-');
        pad(b, t.getMonthValue(), 2);
        b.append('-');
        pad(b, t.getDayOfMonth(), 2);
        b.append('T');
        pad(b, t.getHour(), 2);
        b.append(':');
        pad(b, t.getMinute(), 2);
        b.append(':');
        pad(b, t.getSecond(), 2);
        b.append('.');
        pad(b, ms, 3);
        return b.append('Z').toString();
    }

    /**
     * The milliseconds of a date in the form {@link #formatDate} writes for years 1 to 9999
     * ({@code 2024-03-01T12:00:00.250Z}) in the first {@code n} characters of {@code t}, or
     * Long.MIN_VALUE for any other text, which {@link #parseDate} then reads (and refuses) the
     * general way.
     */
    private static long canonicalDate(char[] t, int n) {
        if (n != 24 || t[4] != '-' || t[7] != '-' || t[10] != 'T' || t[13] != ':' || t[16] != ':' || t[19] != '.'
                || t[23] != 'Z') {
            return Long.MIN_VALUE;
        }
        int year = digits(t, 0, 4);
        int month = digits(t, 5, 2);
        int day = digits(t, 8, 2);
        int hour = digits(t, 11, 2);
        int minute = digits(t, 14, 2);
        int second = digits(t, 17, 2);
        int ms = digits(t, 20, 3);
        if (year <= 0 || month < 1 || month > 12 || day < 1 || day > daysInMonth(year, month) || hour < 0
                || hour > 23 || minute < 0 || minute > 59 || second < 0 || second > 59 || ms < 0) {
            return Long.MIN_VALUE;
        }
        return ((epochDay(year, month, day) * 24 + hour) * 60 + minute) * 60_000L + second * 1000L + ms;
    }

    private static int daysInMonth(int year, int month) {
        if (month == 2) {
            return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0) ? 29 : 28;
        }
        return month == 4 || month == 6 || month == 9 || month == 11 ? 30 : 31;
    }

    /**
     * Days from 1970-01-01 to a date of the proleptic Gregorian calendar with a year from 1: whole
     * 400-year cycles from 0000-03-01, then the years of the cycle and the day of a year that
     * starts in March (so that February's leap day is its last).
     */
    private static long epochDay(int year, int month, int day) {
        int y = month <= 2 ? year - 1 : year;
        int cycle = y / 400;
        int yearOfCycle = y - cycle * 400;
        int dayOfYear = (153 * (month > 2 ? month - 3 : month + 9) + 2) / 5 + day - 1;
        int dayOfCycle = yearOfCycle * 365 + yearOfCycle / 4 - yearOfCycle / 100 + dayOfYear;
        return cycle * 146_097L + dayOfCycle - 719_468;
    }

    /** The number written by {@code n} ASCII digits at {@code from}, or -1. */
    private static int digits(char[] t, int from, int n) {
        int v = 0;
        for (int i = from; i < from + n; i++) {
            char c = t[i];
            if (!isDigit(c)) {
                return -1;
            }
            v = v * 10 + (c - '0');
        }
        return v;
    }

    private static final Pattern DATE = Pattern.compile(
            "(-?)(\\d{4,})-(\\d\\d)-(\\d\\d)T(\\d\\d):(\\d\\d):(\\d\\d)(?:\\.(\\d+))?(Z|[+-]\\d\\d:\\d\\d)?");

    /**
     * {@link #parseDate(String)} of the first {@code n} characters of {@code c}: the form written
     * by {@link #formatDate} is read here, anything else the general way.
     */
    static long parseDate(char[] c, int n) {
        long fast = canonicalDate(c, n);
        return fast != Long.MIN_VALUE ? fast : parseDate(new String(c, 0, n));
    }

    /**
     * Milliseconds since 1970 UTC of an xs:dateTime. A time without zone is taken as UTC; digits
     * finer than a millisecond must be zeros.
     *
     * @throws IllegalArgumentException for any other text
     */
    static long parseDate(String text) {
        String t = text.strip();
        long fast = t.length() == 24 ? canonicalDate(t.toCharArray(), 24) : Long.MIN_VALUE;
        if (fast != Long.MIN_VALUE) {
            return fast;
        }
        Matcher m = DATE.matcher(t);
        if (!m.matches()) {
            throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is not a Date (xs:dateTime such as"
                    + " 2024-03-01T12:00:00.250Z)");
        }
        try {
            if (m.group(2).length() > 10) {
                throw new IllegalArgumentException("the year is out of range");
            }
            long xsdYear = Long.parseLong(m.group(2));
            if (xsdYear == 0) {
                throw new IllegalArgumentException("there is no year 0000 (the year before 0001 is -0001)");
            }
            long year = m.group(1).isEmpty() ? xsdYear : 1 - xsdYear;
            if (year < -999_999_998L || year > 999_999_998L) {
                throw new IllegalArgumentException("the year is out of range");
            }
            int hour = Integer.parseInt(m.group(5));
            int minute = Integer.parseInt(m.group(6));
            int second = Integer.parseInt(m.group(7));
            String frac = m.group(8) == null ? "" : m.group(8);
            int ms = 0;
            for (int i = 0; i < frac.length(); i++) {
                int d = frac.charAt(i) - '0';
                if (i < 3) {
                    ms = ms * 10 + d;
                } else if (d != 0) {
                    throw new IllegalArgumentException("it is more precise than a millisecond");
                }
            }
            for (int i = frac.length(); i < 3; i++) {
                ms *= 10;
            }
            boolean endOfDay = hour == 24;
            if (endOfDay && (minute != 0 || second != 0 || ms != 0)) {
                throw new IllegalArgumentException("hour 24 is only allowed as 24:00:00");
            }
            LocalDateTime local = LocalDateTime.of((int) year, Integer.parseInt(m.group(3)),
                    Integer.parseInt(m.group(4)), endOfDay ? 0 : hour, minute, second);
            long seconds = local.toEpochSecond(ZoneOffset.UTC) + (endOfDay ? 86400 : 0);
            String zone = m.group(9);
            if (zone != null && !zone.equals("Z")) {
                int zh = Integer.parseInt(zone.substring(1, 3));
                int zm = Integer.parseInt(zone.substring(4, 6));
                if (zh > 14 || zm > 59 || (zh == 14 && zm != 0)) {
                    throw new IllegalArgumentException("time zone " + zone + " is out of range");
                }
                int offset = (zh * 3600 + zm * 60) * (zone.charAt(0) == '-' ? -1 : 1);
                seconds -= offset;
            }
            // (seconds + 1) * 1000 - (1000 - ms) reaches Long.MIN_VALUE without overflowing on the way
            return seconds < 0 && ms > 0 ? Math.addExact(Math.multiplyExact(seconds + 1, 1000L), ms - 1000L)
                    : Math.addExact(Math.multiplyExact(seconds, 1000L), ms);
        } catch (DateTimeException | ArithmeticException e) {
            throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is not a valid Date: " + e.getMessage(), e);
        } catch (IllegalArgumentException e) {
            throw new IllegalArgumentException("'" + XmlNames.clip(text) + "' is not a valid Date: " + e.getMessage(), e);
        }
    }
}
