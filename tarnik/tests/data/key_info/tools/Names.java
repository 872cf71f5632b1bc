import java.io.FileInputStream;
import java.io.PrintStream;
import java.nio.charset.StandardCharsets;
import java.security.cert.CertificateFactory;
import java.security.cert.X509Certificate;
import java.util.ArrayList;
import java.util.List;
import java.util.Map;
import javax.security.auth.x500.X500Principal;

/** Prints the subject of a certificate in the spellings of Java and in two that are made here. */
public final class Names {
  /** An attribute of a name: the dotted type, the text, and the encoded value. */
  private record Attribute(String type, String text, byte[] encoded) {}

  private static final Map<String, String> DOTNET_TYPES = Map.ofEntries(
      Map.entry("2.5.4.3", "CN"), Map.entry("2.5.4.4", "SN"), Map.entry("2.5.4.5", "SERIALNUMBER"),
      Map.entry("2.5.4.6", "C"), Map.entry("2.5.4.7", "L"), Map.entry("2.5.4.8", "S"),
      Map.entry("2.5.4.9", "STREET"), Map.entry("2.5.4.10", "O"), Map.entry("2.5.4.11", "OU"),
      Map.entry("2.5.4.12", "T"), Map.entry("2.5.4.17", "PostalCode"), Map.entry("2.5.4.42", "G"),
      Map.entry("2.5.4.43", "I"), Map.entry("1.2.840.113549.1.9.1", "E"),
      Map.entry("0.9.2342.19200300.100.1.25", "DC"));

  private final byte[] der;
  private int position = 0;

  private Names(byte[] der) {
    this.der = der;
  }

  /** Reads a tag and a length, and returns the position after the value. */
  private int enter() {
    position++;
    int length = der[position++] & 0xFF;
    if (length >= 0x80) {
      int octets = length - 0x80;
      for (length = 0; octets > 0; octets--) {
        length = length << 8 | der[position++] & 0xFF;
      }
    }
    return position + length;
  }

  private byte[] upTo(int end) {
    byte[] bytes = java.util.Arrays.copyOfRange(der, position, end);
    position = end;
    return bytes;
  }

  private static String dotted(byte[] content) {
    StringBuilder text = new StringBuilder();
    long number = 0;
    for (byte octet : content) {
      number = number << 7 | octet & 0x7F;
      if (octet < 0) {
        continue;
      }
      if (text.length() == 0) {
        long first = Math.min(number / 40, 2);
        text.append(first).append('.').append(number - 40 * first);
      } else {
        text.append('.').append(number);
      }
      number = 0;
    }
    return text.toString();
  }

  private Attribute readAttribute() {
    enter();
    int end = enter();
    String type = dotted(upTo(end));
    int start = position;
    end = enter();
    String text = new String(upTo(end), StandardCharsets.UTF_8);
    position = start;
    return new Attribute(type, text, upTo(end));
  }

  /** The parts of the name, the most specific one first. */
  private List<List<Attribute>> read() {
    List<List<Attribute>> parts = new ArrayList<>();
    int end = enter();
    while (position < end) {
      List<Attribute> part = new ArrayList<>();
      int endOfPart = enter();
      while (position < endOfPart) {
        part.add(readAttribute());
      }
      parts.add(0, part);
    }
    return parts;
  }

  /** As .NET prints names: quoted if needed, with quotation marks doubled. */
  private static String dotnet(Attribute attribute) {
    String value = attribute.text();
    boolean quoted = value.isEmpty() || !value.equals(value.trim())
        || value.chars().anyMatch(c -> ",+=\"\n<>#;".indexOf(c) >= 0);
    String type = DOTNET_TYPES.getOrDefault(attribute.type(), "OID." + attribute.type());
    return type + "=" + (quoted ? '"' + value.replace("\"", "\"\"") + '"' : value);
  }

  /** As RFC 4514 prescribes for types and values that have no other form. */
  private static String hexadecimal(Attribute attribute) {
    StringBuilder text = new StringBuilder(attribute.type()).append("=#");
    for (byte octet : attribute.encoded()) {
      text.append(String.format("%02x", octet));
    }
    return text.toString();
  }

  private static String join(List<List<Attribute>> parts, String comma, String plus,
      java.util.function.Function<Attribute, String> format) {
    List<String> texts = new ArrayList<>();
    for (List<Attribute> part : parts) {
      texts.add(String.join(plus, part.stream().map(format).toList()));
    }
    return String.join(comma, texts);
  }

  public static void main(String[] arguments) throws Exception {
    PrintStream out = new PrintStream(System.out, true, StandardCharsets.UTF_8);
    CertificateFactory factory = CertificateFactory.getInstance("X.509");
    for (int i = 0; i < arguments.length; i++) {
      try (FileInputStream file = new FileInputStream(arguments[i])) {
        X500Principal name =
            ((X509Certificate) factory.generateCertificate(file)).getSubjectX500Principal();
        List<List<Attribute>> parts = new Names(name.getEncoded()).read();
        String start = String.format("%02d\t", i + 1);
        out.println(start + "java-rfc2253\t" + name.getName(X500Principal.RFC2253));
        out.println(start + "java-rfc1779\t" + name.getName(X500Principal.RFC1779));
        out.println(start + "java-tostring\t" + name);
        out.println(start + "dotnet\t" + join(parts, ", ", " + ", Names::dotnet));
        out.println(start + "hexadecimal\t" + join(parts, ",", "+", Names::hexadecimal));
      }
    }
  }
}
