package com.velmora.tessara.kdmreplica;

import java.math.BigInteger;

/**
 * The double nearest to a decimal number given as digits and a power of ten, computed exactly
 * without text: the product of the digits with a power of ten rounded once when both are exact
 * doubles, otherwise the product with a 128-bit approximation of the power of ten whose rounding
 * is decided only when the approximation's error cannot change it. When it cannot be decided
 * that way (halfway cases, results near the ends of the double range), the caller reads the
 * number the general way.
 */
final class Decimals {
    /** Powers of ten for which the 128-bit table holds a value. */
    private static final int MIN_EXP10 = -348;
    private static final int MAX_EXP10 = 347;
    /**
     * For each power of ten 10^e from {@link #MIN_EXP10}, once first needed: the 128 most
     * significant bits of its exact binary value (rounded down). Threads that race on an entry
     * make equal ones; the final fields publish each whole.
     */
    private static final Power[] POWERS = new Power[MAX_EXP10 - MIN_EXP10 + 1];

    private static final class Power {
        final long hi;
        final long lo;

        Power(BigInteger m) {
            this.hi = m.shiftRight(64).longValue();
            this.lo = m.longValue();
        }
    }

    /** The powers of ten that are exact doubles. */
    private static final double[] SMALL = new double[23];

    static {
        double p = 1;
        for (int i = 0; i < SMALL.length; i++) {
            SMALL[i] = p;
            p *= 10;
        }
    }

    /** A result that means: not decided here. */
    static final double UNDECIDED = Double.NaN;

    private Decimals() {
    }

    private static Power power(int e) {
        Power p = POWERS[e - MIN_EXP10];
        if (p == null) {
            BigInteger m;
            if (e >= 0) {
                BigInteger t = BigInteger.TEN.pow(e);
                int shift = t.bitLength() - 128;
                m = shift >= 0 ? t.shiftRight(shift) : t.shiftLeft(-shift);
            } else {
                BigInteger t = BigInteger.TEN.pow(-e);
                // 2^s / 10^-e lies in [2^127, 2^128) for s = 127 + bitLength(10^-e), as 10^-e is no power of two
                m = BigInteger.ONE.shiftLeft(127 + t.bitLength()).divide(t);
            }
            p = new Power(m);
            POWERS[e - MIN_EXP10] = p;
        }
        return p;
    }

    /** The high 64 bits of the unsigned 128-bit product of a and b. */
    private static long unsignedMultiplyHigh(long a, long b) {
        return Math.multiplyHigh(a, b) + ((a >> 63) & b) + ((b >> 63) & a);
    }

    /**
     * The double nearest to (negative ? -1 : 1) * w * 10^q, rounding half to even, where w is
     * read as an unsigned number; or {@link #UNDECIDED}.
     */
    static double toDouble(boolean negative, long w, int q) {
        if (w == 0) {
            return negative ? -0.0 : 0.0;
        }
        if (w > 0 && w <= 1L << 53 && q >= -22 && q <= 22) {
            // both factors are exact doubles: one rounding, that of the division or multiplication
            double d = q < 0 ? (double) w / SMALL[-q] : (double) w * SMALL[q];
            return negative ? -d : d;
        }
        if (q < MIN_EXP10 || q > MAX_EXP10) {
            return UNDECIDED;
        }
        int clz = Long.numberOfLeadingZeros(w);
        long man = w << clz;
        long exp2 = ((217706L * q) >> 16) + 64 + 1023 - clz;
        Power p = power(q);
        long pHi = p.hi;
        long pLo = p.lo;
        long xHi = unsignedMultiplyHigh(man, pHi);
        long xLo = man * pHi;
        // The table's value is below the true one by less than one unit of its last bit, so the
        // product is below the true one by less than man: widen when that could carry into the
        // bits that decide the rounding.
        if ((xHi & 0x1FF) == 0x1FF && Long.compareUnsigned(xLo + man, man) < 0) {
            long yHi = unsignedMultiplyHigh(man, pLo);
            long yLo = man * pLo;
            long mergedHi = xHi;
            long mergedLo = xLo + yHi;
            if (Long.compareUnsigned(mergedLo, xLo) < 0) {
                mergedHi++;
            }
            if ((mergedHi & 0x1FF) == 0x1FF && mergedLo == -1L && Long.compareUnsigned(yLo + man, man) < 0) {
                return UNDECIDED;
            }
            xHi = mergedHi;
            xLo = mergedLo;
        }
        long msb = xHi >>> 63;
        long mantissa = xHi >>> (msb + 9);
        exp2 -= 1 ^ msb;
        if (xLo == 0 && (xHi & 0x1FF) == 0 && (mantissa & 3) == 1) {
            return UNDECIDED; // possibly halfway between two doubles
        }
        mantissa += mantissa & 1;
        mantissa >>>= 1;
        if (mantissa >>> 53 > 0) {
            mantissa >>>= 1;
            exp2++;
        }
        if (exp2 <= 0 || exp2 >= 0x7FF) {
            return UNDECIDED; // below the normal doubles or beyond the largest
        }
        long bits = exp2 << 52 | mantissa & 0x000F_FFFF_FFFF_FFFFL;
        return Double.longBitsToDouble(negative ? bits | Long.MIN_VALUE : bits);
    }
}
