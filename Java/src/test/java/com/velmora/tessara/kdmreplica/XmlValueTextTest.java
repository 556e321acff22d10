package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.time.Instant;
import java.time.LocalDate;
import java.time.ZoneOffset;
import java.util.Random;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.function.Executable;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;
import org.junit.jupiter.params.provider.ValueSource;

/**
 * Value texts of documents: the quick paths for the common forms (decimal numbers, dates as
 * written), read from characters, accept exactly what the general rules accept, give the same
 * values bit for bit and refuse the rest with the same messages.
 */
class XmlValueTextTest {

    private static char[] chars(String text) {
        // a larger array with other characters after the text: only the first n may be read
        char[] c = new char[text.length() + 3];
        text.getChars(0, text.length(), c, 0);
        c[text.length()] = '7';
        c[text.length() + 1] = 'e';
        c[text.length() + 2] = ' ';
        return c;
    }

    /** The message the String path refuses a text with, or null when it accepts it. */
    private static String refusal(Executable call) {
        try {
            call.execute();
            return null;
        } catch (IllegalArgumentException e) {
            return e.getMessage();
        } catch (Throwable e) {
            throw new AssertionError(e);
        }
    }

    /** Both paths refuse the text with the same message. */
    private static void refusedAlike(Executable byString, Executable byChars) {
        String m = refusal(byString);
        assertNotNull(m, "the general way accepts it");
        assertEquals(m, refusal(byChars));
    }

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {"0|0", "+5|5", "-5|-5", "' 42 '|42", "2147483647|2147483647",
        "-2147483648|-2147483648", "007|7"})
    void integersAreRead(String text, int expected) {
        assertEquals(expected, ValueTexts.parseInt(text));
        assertEquals(expected, ValueTexts.parseInt(chars(text), text.length()));
    }

    @ParameterizedTest
    @ValueSource(strings = {"", "+", "-", "1 2", "1.0", "0x10", "\u0663", "1_000", "2147483648", "--1", "+-1",
        "-2147483649", "9999999999", "12345678901", "4294967296", "+2147483648", "1-"})
    void otherIntegerTextsAreRefused(String text) {
        refusedAlike(() -> ValueTexts.parseInt(text), () -> ValueTexts.parseInt(chars(text), text.length()));
    }

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {"1|1.0", "5.|5.0", ".5|0.5", "-.5|-0.5", "+1E3|1000.0", "1e-2|0.01",
        "1.5E+2|150.0", "INF|Infinity", "-INF|-Infinity", "' 2.25 '|2.25", "-0|-0.0"})
    void doublesAreRead(String text, double expected) {
        assertEquals(Double.doubleToRawLongBits(expected), Double.doubleToRawLongBits(ValueTexts.parseDouble(text, null)));
        assertEquals(Double.doubleToRawLongBits(expected),
                Double.doubleToRawLongBits(ValueTexts.parseDouble(chars(text), text.length(), null)));
    }

    @ParameterizedTest
    @ValueSource(strings = {"", ".", "e5", "1e", "1e+", "1.2.3", "0x1p3", "1d", "1f", "Infinity", "inf", "NAN",
        "\u0661.5", "1 e5", "+.e1", "1e5.5", "1..2", "-", "+", "1e+-5", "1.5e", "--1", "1-"})
    void otherDoubleTextsAreRefused(String text) {
        refusedAlike(() -> ValueTexts.parseDouble(text, null),
                () -> ValueTexts.parseDouble(chars(text), text.length(), null));
    }

    /** Reads a text both ways and checks the bits against the JDK's reading of the same text. */
    private static void readLikeTheJdk(String text) {
        long expected = Double.doubleToRawLongBits(Double.parseDouble(text));
        assertEquals(expected, Double.doubleToRawLongBits(ValueTexts.parseDouble(chars(text), text.length(), null)),
                text);
        assertEquals(expected, Double.doubleToRawLongBits(ValueTexts.parseDouble(text, null)), text);
    }

    @ParameterizedTest
    @ValueSource(strings = {
        // halfway between two doubles: ties go to the even one
        "9007199254740993", "9007199254740995", "9007199254740993.0", "4503599627370496.5", "4503599627370497.5",
        "2.4703282292062327e-324", "2.4703282292062328e-324",
        // the ends of the normal and subnormal ranges and beyond
        "2.2250738585072011e-308", "2.2250738585072012e-308", "2.2250738585072014E-308", "4.9E-324", "5e-324",
        "1e-325", "1.7976931348623157E308", "1.7976931348623158e308", "1.7976931348623159e308", "1e309",
        "0e999999", "1e999999", "1e-999999", "-1e999999",
        // known hard cases, long and short
        "1e23", "8.41e21", "5.0e-324", "9.8813129168249309e-324", "1.00000000000000011102230246251565404236316680908203125",
        "7.2057594037927933e16", "0.1", "0.3", "123456789012345678", "9999999999999999999", "18446744073709551615",
        "18446744073709551616", "0.000000000000000000000000000001", "1000000000000000000000000", "000000001.5e0",
        "3.0000000000000004", "-0.0", "+0e-5", "1E22", "1E23", "9007199254740992e-22", "9007199254740993e22"})
    void hardDecimalsAreReadExactly(String text) {
        readLikeTheJdk(text);
    }

    @Test
    void writtenDoublesOfTheWholeRangeAreReadExactly() {
        Random rnd = new Random(20261206);
        for (int i = 0; i < 200_000; i++) {
            double d = Double.longBitsToDouble(rnd.nextLong());
            if (d == d && !Double.isInfinite(d)) {
                readLikeTheJdk(ValueTexts.formatDouble(d));
            }
            // and the common magnitudes, as the benchmark's prices and weights
            readLikeTheJdk(ValueTexts.formatDouble(rnd.nextDouble() * Math.pow(10, rnd.nextInt(40) - 20)));
        }
    }

    @Test
    void decimalsOfEveryShapeAreReadExactly() {
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

    @ParameterizedTest
    @ValueSource(strings = {"2024-03-01T12:00:00.250Z", "0001-01-01T00:00:00.000Z", "9999-12-31T23:59:59.999Z",
        "2024-02-29T23:59:59.000Z", "1970-01-01T00:00:00.001Z", "1969-12-31T23:59:59.999Z"})
    void datesAsWrittenAreRead(String text) {
        assertEquals(Instant.parse(text).toEpochMilli(), ValueTexts.parseDate(text));
        assertEquals(Instant.parse(text).toEpochMilli(), ValueTexts.parseDate(chars(text), text.length()));
        assertEquals(text, ValueTexts.formatDate(ValueTexts.parseDate(text)));
    }

    @Test
    void everyDayOfTheWrittenYearsIsReadAsJavaTimeReadsIt() {
        // every day of four centuries (leap rules of 100 and 400 years), the first and last days of
        // the range, and random instants of the whole range
        LocalDate end = LocalDate.of(2101, 1, 1);
        for (LocalDate d = LocalDate.of(1700, 1, 1); d.isBefore(end); d = d.plusDays(1)) {
            checkDate(d.atTime(23, 59, 59, 999_000_000).toInstant(ZoneOffset.UTC).toEpochMilli());
        }
        checkDate(Instant.parse("0001-01-01T00:00:00Z").toEpochMilli());
        checkDate(Instant.parse("9999-12-31T23:59:59.999Z").toEpochMilli());
        Random rnd = new Random(11);
        long first = Instant.parse("0001-01-01T00:00:00Z").toEpochMilli();
        long span = Instant.parse("9999-12-31T23:59:59.999Z").toEpochMilli() - first;
        for (int i = 0; i < 100_000; i++) {
            checkDate(first + (long) (rnd.nextDouble() * span));
        }
    }

    private static void checkDate(long millis) {
        String text = ValueTexts.formatDate(millis);
        assertEquals(millis, ValueTexts.parseDate(chars(text), text.length()), text);
        assertEquals(millis, ValueTexts.parseDate(text), text);
    }

    @ParameterizedTest
    @ValueSource(strings = {"2023-02-29T00:00:00.000Z", "2024-13-01T00:00:00.000Z", "2024-00-10T00:00:00.000Z",
        "2024-01-32T00:00:00.000Z", "2024-01-01T25:00:00.000Z", "2024-01-01T00:60:00.000Z",
        "2024-01-01T00:00:60.000Z", "0000-01-01T00:00:00.000Z", "2024-01-01T24:00:01.000Z", "2024-01-0aT00:00:00.000Z",
        "2024/01/01T00:00:00.000Z", "2024-01-01T00:00:00.000X"})
    void impossibleDatesOfTheWrittenShapeAreRefused(String text) {
        IllegalArgumentException e = assertThrows(IllegalArgumentException.class, () -> ValueTexts.parseDate(text));
        assertTrue(e.getMessage().contains("'" + text + "'"), e.getMessage());
        refusedAlike(() -> ValueTexts.parseDate(text), () -> ValueTexts.parseDate(chars(text), text.length()));
    }

    @ParameterizedTest
    @ValueSource(strings = {"1900-02-29T00:00:00.000Z", "2100-02-29T00:00:00.000Z", "2023-04-31T00:00:00.000Z",
        "2023-06-31T00:00:00.000Z", "2023-09-31T00:00:00.000Z", "2023-11-31T00:00:00.000Z", "2023-12-32T00:00:00.000Z",
        "2023-01-00T00:00:00.000Z", "2023-01-01T00:00:00.00aZ", "2023-01-01T00:00:00.000z", "2023-01-01t00:00:00.000Z"})
    void daysThatDoNotExistAreRefusedByBothPaths(String text) {
        refusedAlike(() -> ValueTexts.parseDate(text), () -> ValueTexts.parseDate(chars(text), text.length()));
    }

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {"true|true", "1|true", "false|false", "0|false", "' true'|true", "'0 '|false"})
    void booleansAreRead(String text, boolean expected) {
        assertEquals(expected, ValueTexts.parseBoolean(text));
        assertEquals(expected, ValueTexts.parseBoolean(chars(text), text.length()));
    }

    @ParameterizedTest
    @ValueSource(strings = {"", "True", "TRUE", "yes", "2", "10", "fals", "truee", "t"})
    void otherBooleanTextsAreRefused(String text) {
        refusedAlike(() -> ValueTexts.parseBoolean(text), () -> ValueTexts.parseBoolean(chars(text), text.length()));
    }

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {"2024-01-01T24:00:00.000Z|2024-01-02T00:00:00Z",
        "2024-01-01T00:00:00.000+01:00|2023-12-31T23:00:00Z", "2024-01-01T00:00:00Z|2024-01-01T00:00:00Z",
        "12024-01-01T00:00:00.000Z|+12024-01-01T00:00:00Z", "' 2024-01-01T00:00:00.000Z'|2024-01-01T00:00:00Z"})
    void otherDateFormsTakeTheGeneralPath(String text, String instant) {
        assertEquals(Instant.parse(instant).toEpochMilli(), ValueTexts.parseDate(text));
        assertEquals(Instant.parse(instant).toEpochMilli(), ValueTexts.parseDate(chars(text), text.length()));
    }
}
