// Asks the platform's own verifier (apksig) about packages, as a phone's installer does.
//
// Arguments: the first and the last API level of the phones. Standard input has the path of one
// package a line. Each is answered on standard output by one line, a JSON object in ASCII. The
// program ends with its input. docs/journal.md describes the ranges of API levels; an object with
// "failure" says why the verifier has no answer.

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
import java.nio.charset.StandardCharsets;
import java.security.cert.X509Certificate;
import java.util.ArrayList;
import java.util.List;

public final class InstallerVerifier {
    // The levels at which the platform's rules change: 28 reads v3, 30 asks for v2 where an app
    // targets it, 33 reads v3.1.
    private static final int[] NEW_RULES = {28, 30, 33};

    // Of each kind, so many errors, warnings and signers are told, and so much of a text.
    private static final int MOST = 100;
    private static final int LONGEST_TEXT = 1000;

    // As in the names of apksig's methods, and as people call the schemes.
    private static final String[][] SCHEMES = {{"V1", "v1"}, {"V2", "v2"}, {"V3", "v3"},
        {"V31", "v3.1"}};

    public static void main(String[] arguments) throws Exception {
        int first = Integer.parseInt(arguments[0]);
        int last = Integer.parseInt(arguments[1]);
        // Nothing else may write to what the answers go to.
        PrintStream answers = System.out;
        System.setOut(new PrintStream(OutputStream.nullOutputStream()));
        BufferedReader paths =
                new BufferedReader(new InputStreamReader(System.in, StandardCharsets.UTF_8));
        for (String path = paths.readLine(); path != null; path = paths.readLine()) {
            answers.print(answer(new File(path), first, last) + "\n");
            answers.flush();
        }
    }

    // A file that the verifier has no answer for must not end the answers for the others.
    private static String answer(File file, int first, int last) {
        try (RandomAccessFile opened = new RandomAccessFile(file, "r")) {
            DataSource source = DataSources.asDataSource(opened);
            int lowest = Math.max(first, lowestLevel(source));
            if (lowest > last) {
                return object("ranges", "[" + tooOld(first, last, lowest).json() + "]");
            }
            return object("ranges", ranges(source, lowest, last));
        } catch (Throwable failure) {
            return object("failure", text(failure.toString()));
        }
    }

    // Below it no phone installs the package; 1 where that cannot be read.
    private static int lowestLevel(DataSource source) {
        try {
            return ApkUtils.getMinSdkVersionFromBinaryAndroidManifest(
                    ApkUtils.getAndroidManifest(source));
        } catch (Exception unreadable) {
            return 1;
        }
    }

    // All levels at once; where that is refused, those of equal rules each by itself.
    private static String ranges(DataSource source, int first, int last) throws Exception {
        Range whole = verify(source, first, last);
        if (whole.isVerified) {
            return "[" + whole.json() + "]";
        }
        List<Range> ranges = new ArrayList<>();
        int start = first;
        for (int level : NEW_RULES) {
            if (level > start && level <= last) {
                add(verify(source, start, level - 1), ranges);
                start = level;
            }
        }
        add(start == first ? whole : verify(source, start, last), ranges);
        List<String> told = new ArrayList<>();
        for (Range range : ranges) {
            told.add(range.json());
        }
        return list(told);
    }

    // Neighbours of which the same is said are one range.
    private static void add(Range range, List<Range> ranges) {
        Range before = ranges.isEmpty() ? null : ranges.get(ranges.size() - 1);
        if (before != null && before.said.equals(range.said)) {
            before.last = range.last;
        } else {
            ranges.add(range);
        }
    }

    // The answer for the phones of some levels.
    private static final class Range {
        final int first;
        int last;
        boolean isVerified;
        String said;  // members of an object

        Range(int first, int last) {
            this.first = first;
            this.last = last;
        }

        String json() {
            return "{" + members("first", "" + first, "last", "" + last, "verified", "" + isVerified)
                    + "," + said + "}";
        }
    }

    private static Range verify(DataSource source, int first, int last) throws Exception {
        Range range = new Range(first, last);
        List<String> schemes = new ArrayList<>();
        List<String> signers = new ArrayList<>();
        List<Object> errors = new ArrayList<>();
        List<Object> warnings = new ArrayList<>();
        List<String> malformed = new ArrayList<>();
        try {
            ApkVerifier.Result result = new ApkVerifier.Builder(source)
                    .setMinCheckedPlatformVersion(first)
                    .setMaxCheckedPlatformVersion(last)
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
        }
        range.said = members("schemes", list(schemes), "signers", list(signers),
                "errors", malformed.isEmpty() ? list(issues(errors)) : list(malformed),
                "warnings", list(issues(warnings)));
        return range;
    }

    // Whether the file could be read, and an entry's data are longer than the entry says.
    private static boolean isOfDamagedData(Throwable failure) {
        for (Throwable cause = failure; cause != null; cause = cause.getCause()) {
            if (cause instanceof BufferOverflowException) {
                return true;
            }
        }
        return false;
    }

    // Adds the result's answers for one scheme. Older generations of apksig do not know all
    // schemes, so the methods are looked for by their names.
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

    // ---- JSON: values are texts of JSON already.

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

    // Names in it come from the file, and need not be good UTF-16.
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
