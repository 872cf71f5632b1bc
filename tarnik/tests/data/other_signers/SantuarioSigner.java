// Signs assertions with Apache Santuario (Debian: libxml-security-java).
//
//   java -cp ... SantuarioSigner.java KEY CERTIFICATE METHOD PREFIXES BYTES < unsigned > signed
//
// KEY is a PKCS#8 key in DER, CERTIFICATE a certificate in PEM or DER. PREFIXES is the PrefixList of
// an InclusiveNamespaces element in each transform, or "" for none. BYTES is the length of the
// signature value: the assertion is signed until the value has it.

import java.io.FileInputStream;
import java.nio.file.Files;
import java.nio.file.Path;
import java.security.KeyFactory;
import java.security.PrivateKey;
import java.security.cert.CertificateFactory;
import java.security.cert.X509Certificate;
import java.security.spec.PKCS8EncodedKeySpec;
import java.util.Set;
import java.util.TreeSet;
import javax.xml.parsers.DocumentBuilderFactory;
import javax.xml.transform.OutputKeys;
import javax.xml.transform.Transformer;
import javax.xml.transform.TransformerFactory;
import javax.xml.transform.dom.DOMSource;
import javax.xml.transform.stream.StreamResult;
import org.apache.xml.security.c14n.Canonicalizer;
import org.apache.xml.security.signature.XMLSignature;
import org.apache.xml.security.transforms.Transforms;
import org.apache.xml.security.transforms.params.InclusiveNamespaces;
import org.w3c.dom.Document;
import org.w3c.dom.Element;

public final class SantuarioSigner {
  private static final String SAML = "urn:oasis:names:tc:SAML:2.0:assertion";
  private static final String SHA256 = "http://www.w3.org/2001/04/xmlenc#sha256";

  public static void main(String[] arguments) throws Exception {
    org.apache.xml.security.Init.init();
    X509Certificate certificate = certificate(arguments[1]);
    PrivateKey key = KeyFactory.getInstance(certificate.getPublicKey().getAlgorithm())
        .generatePrivate(new PKCS8EncodedKeySpec(Files.readAllBytes(Path.of(arguments[0]))));
    byte[] unsigned = System.in.readAllBytes();
    for (int attempt = 0; attempt < 1000; ++attempt) {
      Document document = parse(unsigned);
      XMLSignature signature = sign(document, key, certificate, arguments[2], arguments[3]);
      if (signature.getSignatureValue().length == Integer.parseInt(arguments[4])) {
        write(document);
        return;
      }
    }
    System.err.println("No signature has a value of " + arguments[4] + " bytes.");
    System.exit(1);
  }

  private static X509Certificate certificate(String file) throws Exception {
    try (FileInputStream input = new FileInputStream(file)) {
      return (X509Certificate) CertificateFactory.getInstance("X.509").generateCertificate(input);
    }
  }

  private static Document parse(byte[] text) throws Exception {
    DocumentBuilderFactory builders = DocumentBuilderFactory.newInstance();
    builders.setNamespaceAware(true);
    Document document =
        builders.newDocumentBuilder().parse(new java.io.ByteArrayInputStream(text));
    document.getDocumentElement().setIdAttribute("ID", true);
    return document;
  }

  private static void addTransform(Transforms transforms, Document document, String algorithm,
                                   String prefixes) throws Exception {
    if (prefixes.isEmpty()) {
      transforms.addTransform(algorithm);
      return;
    }
    Set<String> set = new TreeSet<>(Set.of(prefixes.split(" ")));
    transforms.addTransform(algorithm, new InclusiveNamespaces(document, set).getElement());
  }

  private static XMLSignature sign(Document document, PrivateKey key, X509Certificate certificate,
                                   String method, String prefixes) throws Exception {
    Element assertion = document.getDocumentElement();
    XMLSignature signature =
        new XMLSignature(document, "", method, Canonicalizer.ALGO_ID_C14N_EXCL_OMIT_COMMENTS);
    assertion.insertBefore(signature.getElement(),
                           document.getElementsByTagNameNS(SAML, "Subject").item(0));
    Transforms transforms = new Transforms(document);
    addTransform(transforms, document, Transforms.TRANSFORM_ENVELOPED_SIGNATURE, prefixes);
    addTransform(transforms, document, Transforms.TRANSFORM_C14N_EXCL_OMIT_COMMENTS, prefixes);
    signature.addDocument("#" + assertion.getAttribute("ID"), transforms, SHA256);
    signature.addKeyInfo(certificate);
    signature.sign(key);
    return signature;
  }

  private static void write(Document document) throws Exception {
    Transformer writer = TransformerFactory.newInstance().newTransformer();
    writer.setOutputProperty(OutputKeys.OMIT_XML_DECLARATION, "yes");
    writer.transform(new DOMSource(document), new StreamResult(System.out));
  }
}
