import java.io.ByteArrayInputStream;
import java.math.BigInteger;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.security.KeyFactory;
import java.security.MessageDigest;
import java.security.PrivateKey;
import java.security.cert.CertificateFactory;
import java.security.cert.X509Certificate;
import java.security.spec.PKCS8EncodedKeySpec;
import java.util.Arrays;
import java.util.Base64;
import java.util.Collections;
import java.util.List;
import javax.xml.crypto.XMLStructure;
import javax.xml.crypto.dom.DOMStructure;
import javax.xml.crypto.dsig.CanonicalizationMethod;
import javax.xml.crypto.dsig.DigestMethod;
import javax.xml.crypto.dsig.Reference;
import javax.xml.crypto.dsig.SignedInfo;
import javax.xml.crypto.dsig.Transform;
import javax.xml.crypto.dsig.XMLSignatureFactory;
import javax.xml.crypto.dsig.dom.DOMSignContext;
import javax.xml.crypto.dsig.keyinfo.KeyInfo;
import javax.xml.crypto.dsig.keyinfo.KeyInfoFactory;
import javax.xml.crypto.dsig.spec.C14NMethodParameterSpec;
import javax.xml.crypto.dsig.spec.TransformParameterSpec;
import javax.xml.parsers.DocumentBuilderFactory;
import javax.xml.transform.OutputKeys;
import javax.xml.transform.TransformerFactory;
import javax.xml.transform.dom.DOMSource;
import javax.xml.transform.stream.StreamResult;
import org.w3c.dom.Document;
import org.w3c.dom.Element;

/** Sign TEMPLATE KEY.pk8 SIGNER.pem NAMED.pem HINT OUTPUT: signs with a KeyInfo that names NAMED. */
public final class Sign {
  private static final String DS11 = "http://www.w3.org/2009/xmldsig11#";
  private static final KeyInfoFactory INFOS = KeyInfoFactory.getInstance("DOM");

  private static X509Certificate certificate(String path) throws Exception {
    return (X509Certificate) CertificateFactory.getInstance("X.509")
        .generateCertificate(new ByteArrayInputStream(Files.readAllBytes(Path.of(path))));
  }

  /** An element of XML Signature 1.1, for which the interface has no class. */
  private static Element ds11(Document document, String name, byte[] content) {
    Element element = document.createElementNS(DS11, "dsig11:" + name);
    element.setAttributeNS("http://www.w3.org/2000/xmlns/", "xmlns:dsig11", DS11);
    element.setTextContent(Base64.getEncoder().encodeToString(content));
    return element;
  }

  private static XMLStructure data(Object content) {
    return INFOS.newX509Data(List.of(content));
  }

  private static XMLStructure digest(Document document, X509Certificate named) throws Exception {
    byte[] digest = MessageDigest.getInstance("SHA-256").digest(named.getEncoded());
    Element element = ds11(document, "X509Digest", digest);
    element.setAttribute("Algorithm", DigestMethod.SHA256);
    return data(new DOMStructure(element));
  }

  private static XMLStructure hint(String kind, Document document, X509Certificate named)
      throws Exception {
    switch (kind) {
      case "key-value":
        return INFOS.newKeyValue(named.getPublicKey());
      case "der-encoded-key-value":
        return new DOMStructure(
            ds11(document, "DEREncodedKeyValue", named.getPublicKey().getEncoded()));
      case "x509-digest":
        return digest(document, named);
      case "x509-ski":
        byte[] extension = named.getExtensionValue("2.5.29.14");
        return data(Arrays.copyOfRange(extension, 4, extension.length));
      case "x509-issuer-serial":
        BigInteger serial = named.getSerialNumber();
        return data(INFOS.newX509IssuerSerial(named.getIssuerX500Principal().getName(), serial));
      case "x509-subject-name":
        return data(named.getSubjectX500Principal().getName());
      default:
        return INFOS.newKeyName("key of the sts");
    }
  }

  private static SignedInfo signedInfo(String id, boolean rsa) throws Exception {
    XMLSignatureFactory factory = XMLSignatureFactory.getInstance("DOM");
    List<Transform> transforms = List.of(
        factory.newTransform(Transform.ENVELOPED, (TransformParameterSpec) null),
        factory.newTransform(CanonicalizationMethod.EXCLUSIVE, (TransformParameterSpec) null));
    Reference reference = factory.newReference("#" + id,
        factory.newDigestMethod(DigestMethod.SHA256, null), transforms, null, null);
    String method = "http://www.w3.org/2001/04/xmldsig-more#" + (rsa ? "rsa" : "ecdsa") + "-sha256";
    return factory.newSignedInfo(
        factory.newCanonicalizationMethod(
            CanonicalizationMethod.EXCLUSIVE, (C14NMethodParameterSpec) null),
        factory.newSignatureMethod(method, null), Collections.singletonList(reference));
  }

  public static void main(String[] arguments) throws Exception {
    X509Certificate signer = certificate(arguments[2]);
    String algorithm = signer.getPublicKey().getAlgorithm();
    PrivateKey key = KeyFactory.getInstance(algorithm)
        .generatePrivate(new PKCS8EncodedKeySpec(Files.readAllBytes(Path.of(arguments[1]))));
    DocumentBuilderFactory builders = DocumentBuilderFactory.newInstance();
    builders.setNamespaceAware(true);
    Document document = builders.newDocumentBuilder().parse(Path.of(arguments[0]).toFile());
    Element root = document.getDocumentElement();
    root.setIdAttribute("ID", true);

    String kind = arguments[4];
    KeyInfo info = kind.equals("none") ? null
        : INFOS.newKeyInfo(List.of(hint(kind, document, certificate(arguments[3]))));
    DOMSignContext context =
        new DOMSignContext(key, root, root.getFirstChild().getNextSibling());
    context.setDefaultNamespacePrefix("ds");
    XMLSignatureFactory.getInstance("DOM")
        .newXMLSignature(signedInfo(root.getAttribute("ID"), algorithm.equals("RSA")), info)
        .sign(context);

    javax.xml.transform.Transformer writer = TransformerFactory.newInstance().newTransformer();
    writer.setOutputProperty(OutputKeys.OMIT_XML_DECLARATION, "yes");
    java.io.StringWriter text = new java.io.StringWriter();
    writer.transform(new DOMSource(document), new StreamResult(text));
    Files.write(Path.of(arguments[5]), text.toString().getBytes(StandardCharsets.UTF_8));
  }
}
