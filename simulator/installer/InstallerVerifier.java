// Asks the platform's own verifier (apksig) whether a phone's installer accepts packages.
//
// Arguments: the first and the last API level of the phones. Standard input: the paths of packages,
// one per line. The answer to each path is one line on standard output, a JSON object in ASCII. The
// program ends at the end of its input. The member "ranges" of the object has the answers for
// ranges of API levels. After a failure, the object has only the member "failure", the reason.

import com.android.apksig.ApkVerifier;
import com.android.apksig.apk.ApkFormatException;
import com.android.apksig.apk.ApkUtils;
import com.android.apksig.util.DataSource;
import com.android.apksig.util.DataSources;
import java.io.BufferedReader;
import java.io.File;
import java.io.IOException;
import java.io.InputStreamReader;
import java.io.OutputStream;
import java.io.PrintStream;
import java.io.RandomAccessFile;
import java.nio.BufferOverflowException;
import java.nio.BufferUnderflowException;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.nio.charset.StandardCharsets;
import java.security.cert.X509Certificate;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.SortedSet;
import java.util.TreeSet;

public final class InstallerVerifier {
    // The API levels at which the platform's rules for signature schemes change. The platform reads
    // v3 from 28 on, requires v2 or later from 30 on if the app targets 30 or later, and reads v3.1
    // from 33 on.
    private static final int KNOWS_V3 = 28;
    private static final int ASKS_FOR_V2 = 30;
    private static final int KNOWS_V31 = 33;
    private static final List<Integer> NEW_RULES = List.of(KNOWS_V3, ASKS_FOR_V2, KNOWS_V31);

    // The limits of an answer: the number of errors, of warnings and of signers for a range, and
    // the number of characters of a text.
    private static final int MOST = 100;
    private static final int LONGEST_TEXT = 1000;

    // The names of the schemes: in the methods of apksig, and in answers.
    private static final String[][] SCHEMES = {{"V1", "v1"}, {"V2", "v2"}, {"V3", "v3"},
        {"V31", "v3.1"}};

    public static void main(String[] arguments) throws Exception {
        int first = Integer.parseInt(arguments[0]);
        int last = Integer.parseInt(arguments[1]);
        // Standard output must have only answers. Output of apksig to System.out is dropped.
        PrintStream answers = System.out;
        System.setOut(new PrintStream(OutputStream.nullOutputStream()));
        BufferedReader paths =
                new BufferedReader(new InputStreamReader(System.in, StandardCharsets.UTF_8));
        for (String path = paths.readLine(); path != null; path = paths.readLine()) {
            answers.print(answer(new File(path), first, last) + "\n");
            answers.flush();
        }
    }

    // If the verifier fails for one file, the program must still answer for the other files.
    private static String answer(File file, int first, int last) {
        try (RandomAccessFile opened = new RandomAccessFile(file, "r")) {
            DataSource source = DataSources.asDataSource(opened);
            int lowest = Math.max(first, lowestLevel(source));
            if (lowest > last) {
                return object("ranges", "[" + tooOld(first, last, lowest).json() + "]");
            }
            return object("ranges", ranges(source, lowest, last));
        } catch (UnknownScheme unknown) {
            return object("failure", text(unknown.getMessage()));
        } catch (Throwable failure) {
            return object("failure", text(failure.toString()));
        }
    }

    // The lowest API level that the manifest allows; 1 if the manifest cannot be read.
    private static int lowestLevel(DataSource source) {
        try {
            return ApkUtils.getMinSdkVersionFromBinaryAndroidManifest(
                    ApkUtils.getAndroidManifest(source));
        } catch (Exception unreadable) {
            return 1;
        }
    }

    // The verifier gives one answer for all levels of a range. A package with v3 or v3.1 can have
    // different signers for different levels. Its levels are therefore split where each of these
    // schemes begins, and where the levels of a signer begin or end. For other packages, all levels
    // are at first one range. If a range is refused, the levels are also split at NEW_RULES, and
    // all ranges are verified again.
    private static String ranges(DataSource source, int first, int last) throws Exception {
        SortedSet<Integer> starts = new TreeSet<>();
        boolean hasNewer = NewerSigners.read(source, starts);
        List<Range> ranges = verifyEach(source, first, last, starts, hasNewer);
        boolean isRefused = ranges.stream().anyMatch(range -> !range.isVerified);
        if (isRefused) {
            starts.addAll(NEW_RULES);
            ranges = verifyEach(source, first, last, starts, hasNewer);
        }
        // The lineage (the record of key rotations) must lead from the signers for earlier levels
        // to the signers for later levels. The verifier checks this only if it verifies all levels
        // together.
        if (!isRefused && hasNewer) {
            Range whole = verify(source, first, last, hasNewer);
            if (!whole.isVerified) {
                ranges = List.of(whole);
            }
        }
        List<String> told = new ArrayList<>();
        for (Range range : ranges) {
            told.add(range.json());
        }
        return list(told);
    }

    // Divides the levels from `first` to `last` into ranges. One range begins at `first`, and one
    // at each later level in `starts`. Verifies each range.
    private static List<Range> verifyEach(DataSource source, int first, int last,
            SortedSet<Integer> starts, boolean hasNewer) throws Exception {
        List<Range> ranges = new ArrayList<>();
        int start = first;
        while (true) {
            SortedSet<Integer> later = starts.tailSet(start + 1);
            boolean isLast = later.isEmpty() || later.first() > last;
            int end = isLast ? last : later.first() - 1;
            add(verify(source, start, end, hasNewer), ranges);
            if (isLast) {
                return ranges;
            }
            start = later.first();
        }
    }

    // Appends the range. If the range before it has the same answer, the two become one range.
    private static void add(Range range, List<Range> ranges) {
        Range before = ranges.isEmpty() ? null : ranges.get(ranges.size() - 1);
        if (before != null && before.said.equals(range.said)) {
            before.last = range.last;
        } else {
            ranges.add(range);
        }
    }

    // Thrown if phones verify the package by a scheme that this version of apksig does not know.
    private static final class UnknownScheme extends Exception {
        private static final long serialVersionUID = 1;

        UnknownScheme(String words) {
            super(words);
        }
    }

    // The answer for the phones of the levels from `first` to `last`.
    private static final class Range {
        final int first;
        int last;
        boolean isVerified;
        String said;  // the answer, as members of a JSON object

        Range(int first, int last) {
            this.first = first;
            this.last = last;
        }

        String json() {
            return "{" + members("first", "" + first, "last", "" + last, "verified", "" + isVerified)
                    + "," + said + "}";
        }
    }

    // Returns the verifier's answer for these levels. Phones of API 30 and later require v2 or
    // later if the app targets 30 or later. The verifier checks this rule only if the range ends at
    // the app's target level or later. If the package has neither v3 nor v3.1, a range that ends at
    // 30 or later is therefore verified without an upper end, so the verifier checks the rule.
    // The rest of its answer does not depend on the end, because only v3 and v3.1 have signers for
    // some levels only. For the same reason, a package with v3 or v3.1 is verified with the exact
    // end.
    private static Range verify(DataSource source, int first, int last, boolean hasNewer)
            throws Exception {
        if (first >= KNOWS_V31 && !hasMethod(ApkVerifier.Result.class, "isVerifiedUsingV31Scheme")
                && NewerSigners.hasV31(source)) {
            throw new UnknownScheme(
                    "this apksig does not know v3.1, which phones of API 33 and later use;"
                    + " --api 27-32 asks only about earlier phones");
        }
        int reach = !hasNewer && last >= ASKS_FOR_V2 ? Integer.MAX_VALUE : last;
        Range range = new Range(first, last);
        List<String> schemes = new ArrayList<>();
        List<String> signers = new ArrayList<>();
        List<Object> errors = new ArrayList<>();
        List<Object> warnings = new ArrayList<>();
        List<String> malformed = new ArrayList<>();
        try {
            ApkVerifier.Result result = new ApkVerifier.Builder(source)
                    .setMinCheckedPlatformVersion(first)
                    .setMaxCheckedPlatformVersion(reach)
                    .build()
                    .verify();
            range.isVerified = result.isVerified();
            errors.addAll(result.getErrors());
            warnings.addAll(result.getWarnings());
            for (String[] scheme : SCHEMES) {
                describe(result, scheme, schemes, signers, errors, warnings);
            }
        } catch (ApkFormatException exception) {
            malformed.add(issue("MALFORMED_APK", new Object[0], exception.getMessage()));
        } catch (IOException exception) {
            if (!isOfDamagedData(exception)) {
                throw exception;
            }
            malformed.add(issue("MALFORMED_APK", new Object[0], exception.getMessage()));
        } catch (RuntimeException exception) {
            // If no signature of the package is for these levels, the verifier throws an exception
            // with this message.
            if (!String.valueOf(exception.getMessage()).startsWith("APK verified, but has not")) {
                throw exception;
            }
            malformed.add(issue("NO_SIGNATURE_FOR_LEVELS", new Object[0],
                    "none of its signatures is for these phones"));
        }
        range.said = members("schemes", list(schemes), "signers", list(signers),
                "errors", malformed.isEmpty() ? list(issues(errors)) : list(malformed),
                "warnings", list(issues(warnings)));
        return range;
    }

    // True if the cause of the exception is an entry whose data are longer than its declared
    // length. Then the package is malformed. Otherwise the file could not be read.
    private static boolean isOfDamagedData(Throwable failure) {
        for (Throwable cause = failure; cause != null; cause = cause.getCause()) {
            if (cause instanceof BufferOverflowException) {
                return true;
            }
        }
        return false;
    }

    // Adds the result's answers for one scheme. Older versions of apksig do not know all schemes,
    // so the methods are looked up by name.
    private static void describe(ApkVerifier.Result result, String[] scheme, List<String> schemes,
            List<String> signers, List<Object> errors, List<Object> warnings) throws Exception {
        boolean isVerified;
        List<?> found;
        try {
            isVerified = (boolean) ask(result, "isVerifiedUsing" + scheme[0] + "Scheme");
            found = (List<?>) ask(result, "get" + scheme[0] + "SchemeSigners");
        } catch (NoSuchMethodException unknown) {
            return;
        }
        if (isVerified) {
            schemes.add(text(scheme[1]));
        }
        for (Object signer : found) {
            errors.addAll((List<?>) ask(signer, "getErrors"));
            warnings.addAll((List<?>) ask(signer, "getWarnings"));
            X509Certificate certificate = (X509Certificate) ask(signer, "getCertificate");
            if (isVerified && certificate != null && signers.size() < MOST) {
                signers.add(object("scheme", text(scheme[1]),
                        "certificate", hex(certificate.getEncoded())));
            }
        }
    }

    private static boolean hasMethod(Class<?> type, String name) {
        return Arrays.stream(type.getMethods()).anyMatch(method -> method.getName().equals(name));
    }

    private static Object ask(Object object, String method) throws Exception {
        return object.getClass().getMethod(method).invoke(object);
    }

    private static Range tooOld(int first, int last, int lowest) {
        Range range = new Range(first, last);
        String issue = issue("MIN_SDK_VERSION", new Object[] {lowest},
                "the app needs API " + lowest + " or later");
        range.said = members("schemes", "[]", "signers", "[]", "errors", "[" + issue + "]",
                "warnings", "[]");
        return range;
    }

    private static List<String> issues(List<Object> found) {
        List<String> told = new ArrayList<>();
        for (Object each : found.subList(0, Math.min(found.size(), MOST))) {
            ApkVerifier.IssueWithParams issue = (ApkVerifier.IssueWithParams) each;
            told.add(issue(issue.getIssue().name(), issue.getParams(), issue.toString()));
        }
        return told;
    }

    private static String issue(String name, Object[] parameters, String words) {
        List<String> texts = new ArrayList<>();
        for (Object parameter : parameters) {
            texts.add(text(String.valueOf(parameter)));
        }
        return object("issue", text(name), "parameters", list(texts), "text", text(words));
    }

    // The signers of v3 and v3.1 in the signing block. Each signer is for a range of levels. This
    // class verifies nothing. Signers after a malformed part of the block are not found, and the
    // verifier reports that part as an error.
    private static final class NewerSigners {
        private static final int V3 = 0xf05368c0;
        private static final int V31 = 0x1b93ad61;
        private static final int NO_PHONES_LEVEL = 10_000;
        private static final int MOST_BYTES = 16 << 20;
        private static final int MOST_SIGNERS = 100;

        // Adds KNOWS_V3 if the package has v3, and KNOWS_V31 if the package has v3.1. Adds each
        // signer's first level, and the level after the signer's last level. Returns true if the
        // package has v3 or v3.1.
        static boolean read(DataSource source, SortedSet<Integer> starts) {
            boolean hasAny = false;
            for (int id : new int[] {V3, V31}) {
                ByteBuffer signers = find(source, id);
                hasAny = hasAny || signers != null;
                if (signers != null) {
                    starts.add(id == V3 ? KNOWS_V3 : KNOWS_V31);
                    addLevels(signers, starts);
                }
            }
            return hasAny;
        }

        static boolean hasV31(DataSource source) {
            return find(source, V31) != null;
        }

        // The fields of a signer: its length, signed data with their length, first level, last
        // level, and more.
        private static void addLevels(ByteBuffer value, SortedSet<Integer> starts) {
            try {
                ByteBuffer signers = take(value);
                for (int i = 0; i < MOST_SIGNERS && signers.hasRemaining(); i++) {
                    ByteBuffer signer = take(signers);
                    take(signer);
                    long first = signer.getInt();
                    long last = signer.getInt();
                    addLevel(first, starts);
                    addLevel(last + 1, starts);
                }
            } catch (BufferUnderflowException | IllegalArgumentException malformed) {
                return;
            }
        }

        // Ignores a level that no phone has. Signers whose range has no beginning or no end use
        // such levels.
        private static void addLevel(long level, SortedSet<Integer> starts) {
            if (level > 0 && level < NO_PHONES_LEVEL) {
                starts.add((int) level);
            }
        }

        // Returns the value of the first pair with the ID `wanted` in the signing block. Returns
        // null if no such pair can be found, or if the block is larger than MOST_BYTES. The fields
        // of a pair: a length of 8 bytes, an ID of 4 bytes, and the value. The block begins with
        // its size (8 bytes). The pairs follow. The block ends with the size again and the magic
        // (24 bytes together).
        private static ByteBuffer find(DataSource source, int wanted) {
            try {
                ApkUtils.ZipSections sections = ApkUtils.findZipSections(source);
                DataSource contents = ApkUtils.findApkSigningBlock(source, sections).getContents();
                if (contents.size() > MOST_BYTES) {
                    return null;
                }
                ByteBuffer block = contents.getByteBuffer(0, (int) contents.size());
                block.order(ByteOrder.LITTLE_ENDIAN).position(8).limit(block.limit() - 24);
                while (block.remaining() >= 12) {
                    long length = block.getLong();
                    if (length < 4 || length > block.remaining()) {
                        return null;
                    }
                    ByteBuffer pair = slice(block, (int) length);
                    if (pair.getInt() == wanted) {
                        return pair;
                    }
                }
                return null;
            } catch (Exception malformed) {
                return null;
            }
        }

        private static ByteBuffer take(ByteBuffer bytes) {
            return slice(bytes, bytes.getInt());
        }

        // Returns the next bytes of the buffer, and moves its position behind them.
        private static ByteBuffer slice(ByteBuffer bytes, int length) {
            ByteBuffer part = bytes.slice().order(ByteOrder.LITTLE_ENDIAN);
            part.limit(length);
            bytes.position(bytes.position() + length);
            return part;
        }
    }

    // ---- JSON. The values that `object`, `members` and `list` get are already JSON texts.

    private static String object(String... members) {
        return "{" + members(members) + "}";
    }

    private static String members(String... members) {
        StringBuilder json = new StringBuilder();
        for (int i = 0; i < members.length; i += 2) {
            json.append(i == 0 ? "" : ",").append(text(members[i])).append(':').append(members[i + 1]);
        }
        return json.toString();
    }

    private static String list(List<String> values) {
        return "[" + String.join(",", values) + "]";
    }

    // `words` may contain a name from the package. This name can be invalid UTF-16.
    private static String text(String words) {
        String all = words == null ? "" : words;
        StringBuilder json = new StringBuilder("\"");
        all.codePoints().limit(LONGEST_TEXT).forEach(point -> {
            boolean isSurrogate = point >= Character.MIN_SURROGATE && point <= Character.MAX_SURROGATE;
            int shown = isSurrogate ? 0xfffd : point;
            if (shown >= 0x20 && shown < 0x7f && shown != '"' && shown != '\\') {
                json.append((char) shown);
            } else {
                for (char unit : Character.toChars(shown)) {
                    json.append(String.format("\\u%04x", (int) unit));
                }
            }
        });
        return json.append('"').toString();
    }

    private static String hex(byte[] bytes) {
        StringBuilder digits = new StringBuilder("\"");
        for (byte each : bytes) {
            digits.append(String.format("%02x", each));
        }
        return digits.append('"').toString();
    }
}
