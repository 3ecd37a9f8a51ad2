// Reads every *.mf file of a directory with the JDK's own parser. For each FILE, writes the parsed
// contents to FILE.dump, and the manifest in the JDK's own layout to FILE.rewritten. The dump has a
// line "Section <name>" per section (the main section first, without a name) and a line
// "<attribute>: <value>" per attribute. Sections and attributes are sorted by name.
import java.io.FileInputStream;
import java.io.FileOutputStream;
import java.io.IOException;
import java.io.PrintStream;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.TreeMap;
import java.util.jar.Attributes;
import java.util.jar.Manifest;

public class DumpManifest {
  public static void main(String[] arguments) throws IOException {
    try (var files = Files.newDirectoryStream(Path.of(arguments[0]), "*.mf")) {
      for (Path file : files) dump(file.toString());
    }
  }

  private static void dump(String path) throws IOException {
    Manifest manifest;
    try (var in = new FileInputStream(path)) {
      manifest = new Manifest(in);
    }
    try (var out = new PrintStream(path + ".dump", StandardCharsets.UTF_8)) {
      print(out, "", manifest.getMainAttributes());
      new TreeMap<>(manifest.getEntries()).forEach((name, section) -> print(out, name, section));
    }
    try (var out = new FileOutputStream(path + ".rewritten")) {
      manifest.write(out);
    }
  }

  private static void print(PrintStream out, String name, Attributes section) {
    out.print("Section " + name + "\n");
    var sorted = new TreeMap<String, Object>();
    section.forEach((key, value) -> sorted.put(key.toString(), value));
    sorted.forEach((key, value) -> out.print(key + ": " + value + "\n"));
  }
}
