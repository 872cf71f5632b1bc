#!/bin/sh
# Recreates the files in this folder with new keys: see README.md. Needs openssl, xmlsec1, a JDK of
# version 17 or later, libxml-security-java, and xml-crypto, which npm installs to a temporary folder.
set -eu

out=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

ds=http://www.w3.org/2000/09/xmldsig#
exclusive=http://www.w3.org/2001/10/xml-exc-c14n#
saml=urn:oasis:names:tc:SAML:2.0:assertion
rsa=http://www.w3.org/2001/04/xmldsig-more#rsa-sha256
ecdsa=http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512

# certify NAME OPTION...: makes a key by these options of genpkey, and its certificate.
certify() {
  name=$1
  shift
  openssl genpkey "$@" -out "$work/$name.key" 2> "$work/log"
  openssl pkcs8 -topk8 -nocrypt -in "$work/$name.key" -outform DER -out "$work/$name.der"
  openssl req -x509 -new -key "$work/$name.key" -subj "/O=Test/CN=$name" -days 36500 -sha256 \
    -out "$out/$name.pem"
}

# assertion SURNAME [SIGNATURE]: prints an assertion whose AttributeValue of the surname is SURNAME.
assertion() {
  claims=http://schemas.xmlsoap.org/ws/2005/05/identity/claims
  cat << END
<saml2:Assertion xmlns:saml2="$saml" xmlns:xsi="http://www.w3.org/2001/XMLSchema-instance" \
ID="_a1" IssueInstant="2020-01-01T00:00:00.000Z" Version="2.0">
  <saml2:Issuer>https://sts.example/</saml2:Issuer>${2-}
  <saml2:Subject>
    <saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">ada@example</saml2:NameID>
    <saml2:SubjectConfirmation Method="urn:oasis:names:tc:SAML:2.0:cm:bearer">
      <saml2:SubjectConfirmationData NotOnOrAfter="2126-01-01T00:00:00.000Z"/>
    </saml2:SubjectConfirmation>
  </saml2:Subject>
  <saml2:Conditions NotBefore="2020-01-01T00:00:00.000Z" NotOnOrAfter="2126-01-01T00:00:00.000Z"/>
  <saml2:AuthnStatement AuthnInstant="2020-01-01T00:00:00.000Z">
    <saml2:AuthnContext>
      <saml2:AuthnContextClassRef>urn:oasis:names:tc:SAML:2.0:ac:classes:PasswordProtectedTransport\
</saml2:AuthnContextClassRef>
    </saml2:AuthnContext>
  </saml2:AuthnStatement>
  <saml2:AttributeStatement>
    <saml2:Attribute Name="$claims/givenname">
      <saml2:AttributeValue>Ada</saml2:AttributeValue>
    </saml2:Attribute>
    <saml2:Attribute Name="$claims/surname">
      $1
    </saml2:Attribute>
  </saml2:AttributeStatement>
</saml2:Assertion>
END
}

# template METHOD PREFIXES: prints the signature that xmlsec1 completes.
template() {
  list=
  if [ -n "$2" ]; then
    list="<ec:InclusiveNamespaces xmlns:ec=\"$exclusive\" PrefixList=\"$2\"/>"
  fi
  printf '%s' "<ds:Signature xmlns:ds=\"$ds\"><ds:SignedInfo>" \
    "<ds:CanonicalizationMethod Algorithm=\"$exclusive\"/>" \
    "<ds:SignatureMethod Algorithm=\"$1\"/><ds:Reference URI=\"#_a1\"><ds:Transforms>" \
    "<ds:Transform Algorithm=\"${ds}enveloped-signature\">$list</ds:Transform>" \
    "<ds:Transform Algorithm=\"$exclusive\">$list</ds:Transform></ds:Transforms>" \
    "<ds:DigestMethod Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/><ds:DigestValue/>" \
    "</ds:Reference></ds:SignedInfo><ds:SignatureValue/>" \
    "<ds:KeyInfo><ds:X509Data><ds:X509Certificate/></ds:X509Data></ds:KeyInfo></ds:Signature>"
}

# Each of these signs an assertion with the key NAME. PREFIXES is a prefix list for each transform.

# xmlsec NAME METHOD PREFIXES SURNAME FILE
xmlsec() {
  assertion "$4" "$(template "$2" "$3")" > "$work/template.xml"
  xmlsec1 --sign --privkey-pem "$work/$1.key,$out/$1.pem" --id-attr:ID "$saml:Assertion" \
    --output "$out/$5" "$work/template.xml"
}

# jdk NAME METHOD SURNAME FILE
jdk() {
  assertion "$3" |
    java "$out/JdkSigner.java" sign "$work/$1.der" "$out/$1.pem" "$2" > "$out/$4"
}

# santuario NAME METHOD PREFIXES BYTES SURNAME FILE: the signature value has BYTES bytes.
santuario() {
  jars=/usr/share/java
  assertion "$5" |
    java -cp "$jars/xmlsec.jar:$jars/commons-codec.jar:$jars/slf4j-api.jar" \
      "$out/SantuarioSigner.java" "$work/$1.der" "$out/$1.pem" "$2" "$3" "$4" \
      > "$out/$6" 2> "$work/log" || { cat "$work/log" >&2; exit 1; }
}

# xml_crypto NAME PREFIXES SURNAME FILE
xml_crypto() {
  assertion "$3" |
    NODE_PATH=$work/node_modules node "$out/xml_crypto_signer.js" "$work/$1.key" "$out/$1.pem" \
      "$2" > "$out/$4"
}

npm install --silent --no-audit --no-fund --prefix "$work" xml-crypto@6.3.2 > "$work/log" 2>&1

certify rsa -algorithm RSA -pkeyopt rsa_keygen_bits:2048
certify p521 -algorithm EC -pkeyopt ec_paramgen_curve:P-521

rm -f "$out"/*.xml

plain='<saml2:AttributeValue>Byron</saml2:AttributeValue>'
undeclared='<saml2:AttributeValue xsi:type="xs:string">Byron</saml2:AttributeValue>'
empty='<saml2:AttributeValue/>'

santuario p521 $ecdsa '' 130 "$plain" santuario-p521-short.xml
santuario p521 $ecdsa '' 132 "$plain" santuario-p521.xml
jdk p521 $ecdsa "$plain" jdk-p521.xml
xmlsec p521 $ecdsa '' "$plain" xmlsec1-p521.xml

santuario rsa $rsa 'saml2 xsi' 256 "$plain" santuario-prefix-list.xml
xml_crypto rsa 'saml2 xsi' "$plain" xml-crypto-prefix-list.xml
xmlsec rsa $rsa 'saml2 xsi' "$plain" xmlsec1-prefix-list.xml

jdk rsa $rsa "$undeclared" jdk-undeclared-type-prefix.xml
xml_crypto rsa '' "$undeclared" xml-crypto-undeclared-type-prefix.xml
xmlsec rsa $rsa '' "$undeclared" xmlsec1-undeclared-type-prefix.xml

jdk rsa $rsa "$empty" jdk-empty-value.xml
xml_crypto rsa '' "$empty" xml-crypto-empty-value.xml
xmlsec rsa $rsa '' "$empty" xmlsec1-empty-value.xml

for file in "$out"/*.xml; do
  name=rsa
  case $file in *p521*) name=p521 ;; esac
  xmlsec1 --verify --enabled-key-data x509 --trusted-pem "$out/$name.pem" \
    --id-attr:ID "$saml:Assertion" "$file" 2> "$work/log" ||
    { echo "$file" >&2; cat "$work/log" >&2; exit 1; }
  java "$out/JdkSigner.java" verify "$out/$name.pem" < "$file" || { echo "$file" >&2; exit 1; }
done
