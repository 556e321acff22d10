package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.*;

import java.time.Instant;
import java.time.LocalDate;
import java.time.ZoneOffset;
import java.time.format.DateTimeFormatter;
import java.util.Random;
import java.util.concurrent.Callable;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;
import org.junit.jupiter.params.provider.ValueSource;

/**
 * Value texts of documents: the quick paths for the common forms (decimal numbers, dates as
 * written), read from characters, accept exactly what the general rules accept, give the same
 * values bit for bit and refuse the rest with the same messages.
 */
class XmlValueTextTest {

    /** The text in a larger array, other characters after it: only the first n may be read. */
    private static char[] chars(String text) {
        return (text + "7e ").toCharArray();
    }

    /** What a reading gives: its value, or the message it was refused with (a String). */
    private static Object answer(Callable<Object> read) {
        try {
            return read.call();
        } catch (IllegalArgumentException e) {
            return e.getMessage();
        } catch (Exception e) {
            throw new AssertionError(e);
        }
    }

    private static long bits(double d) {
        return Double.doubleToRawLongBits(d);
    }

    /** kind, text, value (empty: refused). */
    @ParameterizedTest(name = "{0} \"{1}\"")
    @CsvSource(delimiter = '|', value = {
        "int|0|0", "int|+5|5", "int|-5|-5", "int|' 42 '|42", "int|2147483647|2147483647", "int|-2147483648|-2147483648",
        "int|007|7", "int|''|", "int|+|", "int|-|", "int|1 2|", "int|1.0|", "int|0x10|", "int|\u0663|", "int|1_000|",
        "int|2147483648|", "int|--1|", "int|+-1|", "int|-2147483649|", "int|9999999999|", "int|12345678901|",
        "int|4294967296|", "int|+2147483648|", "int|1-|",
        "double|1|1.0", "double|5.|5.0", "double|.5|0.5", "double|-.5|-0.5", "double|+1E3|1000.0", "double|1e-2|0.01",
        "double|1.5E+2|150.0", "double|INF|Infinity", "double|-INF|-Infinity", "double|' 2.25 '|2.25", "double|-0|-0.0",
        "double|''|", "double|.|", "double|e5|", "double|1e|", "double|1e+|", "double|1.2.3|", "double|0x1p3|",
        "double|1d|", "double|1f|", "double|Infinity|", "double|inf|", "double|NAN|", "double|\u0661.5|",
        "double|1 e5|", "double|+.e1|", "double|1e5.5|", "double|1..2|", "double|-|", "double|+|", "double|1e+-5|",
        "double|1.5e|", "double|--1|", "double|1-|",
        "boolean|true|true", "boolean|1|true", "boolean|false|false", "boolean|0|false", "boolean|' true'|true",
        "boolean|'0 '|false", "boolean|''|", "boolean|True|", "boolean|TRUE|", "boolean|yes|", "boolean|2|",
        "boolean|10|", "boolean|fals|", "boolean|truee|", "boolean|t|"})
    void numbersAndBooleansAreReadOrRefusedAlikeByBothPaths(String kind, String text, String value) {
        char[] c = chars(text);
        int n = text.length();
        Object[] got = kind.equals("int") ? new Object[] {answer(() -> ValueTexts.parseInt(text)),
            answer(() -> ValueTexts.parseInt(c, n))} : kind.equals("double")
            ? new Object[] {answer(() -> bits(ValueTexts.parseDouble(text, null))),
                answer(() -> bits(ValueTexts.parseDouble(c, n, null)))}
            : new Object[] {answer(() -> ValueTexts.parseBoolean(text)), answer(() -> ValueTexts.parseBoolean(c, n))};
        assertEquals(got[0], got[1], "the character path answers otherwise");
        if (value == null) {
            assertTrue(got[0] instanceof String && ((String) got[0]).contains(text.trim()), "refused: " + got[0]);
        } else {
            assertEquals(kind.equals("int") ? (Object) Integer.parseInt(value) : kind.equals("double")
                    ? (Object) bits(Double.parseDouble(value)) : (Object) Boolean.parseBoolean(value), got[0]);
        }
    }

    /** Reads a text both ways and checks the bits against the JDK's reading of the same text. */
    private static void readLikeTheJdk(String text) {
        long expected = bits(Double.parseDouble(text));
        assertEquals(expected, bits(ValueTexts.parseDouble(chars(text), text.length(), null)), text);
        assertEquals(expected, bits(ValueTexts.parseDouble(text, null)), text);
    }

    @Test
    void decimalsOfEveryShapeAreReadExactly() {
        // ties to even, rounding up into the next binade, subnormals, and the largest double and beyond
        for (String hard : new String[] {"9007199254740993", "4503599627370497.5", "18446744073709551615",
            "2.4703282292062327e-324", "1.7976931348623159e308", "1.00000000000000011102230246251565404236316680908203125"}) {
            readLikeTheJdk(hard);
        }
        Random rnd = new Random(7);
        for (int i = 0; i < 200_000; i++) {
            StringBuilder b = new StringBuilder();
            int sign = rnd.nextInt(3);
            b.append(sign == 0 ? "" : sign == 1 ? "-" : "+");
            for (int z = rnd.nextInt(4) == 0 ? rnd.nextInt(5) : 0; z > 0; z--) {
                b.append('0');
            }
            int digits = 1 + rnd.nextInt(21);
            int dot = rnd.nextInt(digits + 2) - 1; // -1: no point
            for (int k = 0; k < digits; k++) {
                if (k == dot) {
                    b.append('.');
                }
                b.append((char) ('0' + rnd.nextInt(10)));
            }
            if (dot == digits) {
                b.append('.');
            }
            if (rnd.nextBoolean()) {
                b.append(rnd.nextBoolean() ? 'e' : 'E');
                int e = rnd.nextInt(5) == 0 ? rnd.nextInt(800) - 400 : rnd.nextInt(60) - 30;
                b.append(e >= 0 && rnd.nextBoolean() ? "+" : "").append(e);
            }
            readLikeTheJdk(b.toString());
        }
    }

    @Test
    void everyDayOfTheWrittenYearsIsReadAsJavaTimeReadsIt() {
        // every day of four centuries (leap rules of 100 and 400 years), the first and last instants
        // of the range, and random instants of the whole range, written and read as java.time does
        LocalDate end = LocalDate.of(2101, 1, 1);
        for (LocalDate d = LocalDate.of(1700, 1, 1); d.isBefore(end); d = d.plusDays(1)) {
            checkDate(d.atTime(23, 59, 59, 999_000_000).toInstant(ZoneOffset.UTC).toEpochMilli());
        }
        checkDate(Instant.parse("0001-01-01T00:00:00Z").toEpochMilli());
        checkDate(Instant.parse("9999-12-31T23:59:59.999Z").toEpochMilli());
        checkDate(-1);
        Random rnd = new Random(11);
        long first = Instant.parse("0001-01-01T00:00:00Z").toEpochMilli();
        long span = Instant.parse("9999-12-31T23:59:59.999Z").toEpochMilli() - first;
        for (int i = 0; i < 100_000; i++) {
            checkDate(first + (long) (rnd.nextDouble() * span));
        }
    }

    private static final DateTimeFormatter WRITTEN = DateTimeFormatter.ofPattern("uuuu-MM-dd'T'HH:mm:ss.SSS'Z'")
            .withZone(ZoneOffset.UTC);

    private static void checkDate(long millis) {
        String text = ValueTexts.formatDate(millis);
        assertEquals(WRITTEN.format(Instant.ofEpochMilli(millis)), text);
        assertEquals(millis, ValueTexts.parseDate(chars(text), text.length()), text);
        assertEquals(millis, ValueTexts.parseDate(text), text);
    }

    @ParameterizedTest
    @ValueSource(strings = {"2023-02-29T00:00:00.000Z", "2024-13-01T00:00:00.000Z", "2024-00-10T00:00:00.000Z",
        "2024-01-32T00:00:00.000Z", "2024-01-01T25:00:00.000Z", "2024-01-01T00:60:00.000Z",
        "2024-01-01T00:00:60.000Z", "0000-01-01T00:00:00.000Z", "2024-01-01T24:00:01.000Z", "2024-01-0aT00:00:00.000Z",
        "2024/01/01T00:00:00.000Z", "2024-01-01T00:00:00.000X", "1900-02-29T00:00:00.000Z", "2100-02-29T00:00:00.000Z",
        "2023-04-31T00:00:00.000Z", "2023-06-31T00:00:00.000Z", "2023-09-31T00:00:00.000Z", "2023-11-31T00:00:00.000Z",
        "2023-12-32T00:00:00.000Z", "2023-01-00T00:00:00.000Z", "2023-01-01T00:00:00.00aZ", "2023-01-01T00:00:00.000z",
        "2023-01-01t00:00:00.000Z"})
    void impossibleDatesOfTheWrittenShapeAreRefusedByBothPaths(String text) {
        Object m = answer(() -> ValueTexts.parseDate(text));
        assertTrue(m instanceof String && ((String) m).contains("'" + text + "'"), String.valueOf(m));
        assertEquals(m, answer(() -> ValueTexts.parseDate(chars(text), text.length())));
    }
}
