package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.time.Instant;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;
import org.junit.jupiter.params.provider.ValueSource;

/**
 * Value texts of documents: the quick paths for the common forms (decimal numbers, dates as
 * written) accept exactly what the general rules accept.
 */
class XmlValueTextTest {

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {"0|0", "+5|5", "-5|-5", "' 42 '|42", "2147483647|2147483647",
        "-2147483648|-2147483648", "007|7"})
    void integersAreRead(String text, int expected) {
        assertEquals(expected, XmlSupport.parseInt(text));
    }

    @ParameterizedTest
    @ValueSource(strings = {"", "+", "-", "1 2", "1.0", "0x10", "\u0663", "1_000", "2147483648", "--1", "+-1"})
    void otherIntegerTextsAreRefused(String text) {
        assertThrows(IllegalArgumentException.class, () -> XmlSupport.parseInt(text));
    }

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {"1|1.0", "5.|5.0", ".5|0.5", "-.5|-0.5", "+1E3|1000.0", "1e-2|0.01",
        "1.5E+2|150.0", "INF|Infinity", "-INF|-Infinity", "' 2.25 '|2.25", "-0|-0.0"})
    void doublesAreRead(String text, double expected) {
        assertEquals(Double.doubleToRawLongBits(expected), Double.doubleToRawLongBits(XmlSupport.parseDouble(text, null)));
    }

    @ParameterizedTest
    @ValueSource(strings = {"", ".", "e5", "1e", "1e+", "1.2.3", "0x1p3", "1d", "1f", "Infinity", "inf", "NAN",
        "\u0661.5", "1 e5", "+.e1"})
    void otherDoubleTextsAreRefused(String text) {
        assertThrows(IllegalArgumentException.class, () -> XmlSupport.parseDouble(text, null));
    }

    @ParameterizedTest
    @ValueSource(strings = {"2024-03-01T12:00:00.250Z", "0001-01-01T00:00:00.000Z", "9999-12-31T23:59:59.999Z",
        "2024-02-29T23:59:59.000Z", "1970-01-01T00:00:00.001Z", "1969-12-31T23:59:59.999Z"})
    void datesAsWrittenAreRead(String text) {
        assertEquals(Instant.parse(text).toEpochMilli(), XmlSupport.parseDate(text));
        assertEquals(text, XmlSupport.formatDate(XmlSupport.parseDate(text)));
    }

    @ParameterizedTest
    @ValueSource(strings = {"2023-02-29T00:00:00.000Z", "2024-13-01T00:00:00.000Z", "2024-00-10T00:00:00.000Z",
        "2024-01-32T00:00:00.000Z", "2024-01-01T25:00:00.000Z", "2024-01-01T00:60:00.000Z",
        "2024-01-01T00:00:60.000Z", "0000-01-01T00:00:00.000Z", "2024-01-01T24:00:01.000Z", "2024-01-0aT00:00:00.000Z",
        "2024/01/01T00:00:00.000Z", "2024-01-01T00:00:00.000X"})
    void impossibleDatesOfTheWrittenShapeAreRefused(String text) {
        IllegalArgumentException e = assertThrows(IllegalArgumentException.class, () -> XmlSupport.parseDate(text));
        assertTrue(e.getMessage().contains("'" + text + "'"), e.getMessage());
    }

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {"2024-01-01T24:00:00.000Z|2024-01-02T00:00:00Z",
        "2024-01-01T00:00:00.000+01:00|2023-12-31T23:00:00Z", "2024-01-01T00:00:00Z|2024-01-01T00:00:00Z",
        "12024-01-01T00:00:00.000Z|+12024-01-01T00:00:00Z"})
    void otherDateFormsTakeTheGeneralPath(String text, String instant) {
        assertEquals(Instant.parse(instant).toEpochMilli(), XmlSupport.parseDate(text));
    }
}
