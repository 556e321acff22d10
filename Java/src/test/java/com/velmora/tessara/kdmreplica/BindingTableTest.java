package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.*;

import java.lang.invoke.MethodType;
import java.lang.reflect.Executable;
import java.lang.reflect.Field;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.nio.file.Files;
import java.nio.file.Paths;
import java.util.*;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import java.util.stream.Stream;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.MethodSource;

/**
 * Every row of the native binding table (BindingTable.def, read from the path in the system
 * property corvexa.bindings) resolves against this package as the native library resolves it at
 * start-up: classes exist (ours public and, when proxied, subclassable as test doubles), members
 * exist with their exact name, JNI signature and static-ness, enumeration constants are static
 * fields of their enumeration's own type.
 */
class BindingTableTest {
    private static final Pattern DEFINE = Pattern.compile("#define\\s+(\\w+)\\s+\"([^\"]*)\"");
    private static final Pattern ROW = Pattern.compile("(CLASS|METHOD|STATIC|SETTER_FIRST|CONSTANT|RESERVED)\\((.*)\\)");
    private static final Pattern PART = Pattern.compile("\\s*(?:\"([^\"]*)\"|(\\w+))\\s*");

    /** kind, class path of the CLASS row above (or its own path), slot, member or field, signature. */
    static List<String[]> rows() throws Exception {
        String path = System.getProperty("corvexa.bindings");
        assertNotNull(path, "the JVM needs -Dcorvexa.bindings=<path of BindingTable.def>");
        Map<String, String> macros = new HashMap<>();
        List<String[]> rows = new ArrayList<>();
        String owner = null;
        boolean comment = false;
        for (String line : Files.readAllLines(Paths.get(path))) {
            String t = line.trim();
            if (comment || t.startsWith("/*")) {
                comment = !t.contains("*/");
                continue;
            }
            Matcher d = DEFINE.matcher(t);
            Matcher r = ROW.matcher(t);
            if (d.matches()) {
                macros.put(d.group(1), d.group(2));
            } else if (r.matches()) {
                String[] args = r.group(2).split(",(?=(?:[^\"]*\"[^\"]*\")*[^\"]*$)");
                String[] row = {r.group(1), owner, args[0].trim(), null, null};
                for (int i = 1; i < args.length; i++) {
                    row[i + 2] = concat(args[i], macros, line);
                }
                owner = row[0].equals("CLASS") ? row[3] : owner;
                row[1] = owner;
                rows.add(row);
            } else {
                assertTrue(t.isEmpty() || t.startsWith("#undef"), "a line of the table that is no row: " + line);
            }
        }
        return rows;
    }

    /** A macro argument: quoted strings and macro names, concatenated as the preprocessor does. */
    private static String concat(String arg, Map<String, String> macros, String line) {
        StringBuilder b = new StringBuilder();
        Matcher m = PART.matcher(arg);
        int at = 0;
        while (at < arg.length() && m.find(at) && m.start() == at) {
            b.append(m.group(1) != null ? m.group(1) : macros.get(m.group(2)));
            assertTrue(m.group(1) != null || macros.containsKey(m.group(2)), "unknown macro in " + line);
            at = m.end();
        }
        assertEquals(arg.length(), at, "cannot read the argument " + arg + " of " + line);
        return b.toString();
    }

    @Test
    void theTableHasRowsOfEveryKind() throws Exception {
        List<String[]> rows = rows();
        for (String kind : new String[] {"CLASS", "METHOD", "STATIC", "SETTER_FIRST", "CONSTANT", "RESERVED"}) {
            assertTrue(rows.stream().anyMatch(r -> r[0].equals(kind)), "no " + kind + " row");
        }
        assertTrue(rows.size() > 150, rows.size() + " rows");
    }

    private static String signature(Executable e) {
        return MethodType.methodType(e instanceof Method ? ((Method) e).getReturnType() : void.class,
                e.getParameterTypes()).toMethodDescriptorString();
    }

    @ParameterizedTest(name = "{0} {2}")
    @MethodSource("rows")
    void everyRowResolves(String kind, String owner, String slot, String member, String sig) throws Exception {
        if (kind.equals("RESERVED")) {
            assertTrue(slot.matches("\\w+"), slot);
            return;
        }
        Class<?> c = Class.forName(owner.replace('/', '.'));
        boolean ours = c.getName().startsWith("com.velmora.tessara");
        switch (kind) {
            case "CLASS":
                if (ours) {
                    assertTrue(Modifier.isPublic(c.getModifiers()), slot);
                    // Test doubles subclass the classes whose objects proxies hold (not static holders).
                    assertTrue(c.isEnum() || !Modifier.isFinal(c.getModifiers()) || c.getConstructors().length == 0,
                            slot + " must stay subclassable");
                }
                break;
            case "CONSTANT":
                Field f = c.getField(member);
                assertSame(c, f.getType(), slot);
                assertTrue(Modifier.isStatic(f.getModifiers()) && f.isEnumConstant(), slot);
                break;
            default:
                boolean isStatic = kind.equals("STATIC");
                Stream<Executable> candidates = member.equals("<init>") ? Arrays.stream(c.getConstructors())
                        : Arrays.stream(c.getMethods()).filter(m -> m.getName().equals(member)).map(m -> m);
                Executable e = candidates.filter(x -> signature(x).equals(sig)).findFirst()
                        .orElseThrow(() -> new AssertionError(slot + ": no " + member + sig + " in " + c.getName()));
                assertTrue(Modifier.isPublic(e.getModifiers()), slot);
                assertEquals(isStatic, Modifier.isStatic(e.getModifiers()), slot);
                if (!isStatic && e instanceof Method) {
                    assertFalse(Modifier.isFinal(e.getModifiers()), slot + " must stay overridable for test doubles");
                }
        }
    }
}
