#!/bin/sh
# Recreates the files in signatures/ with new keys. Needs openssl and xmlsec1.
set -eu

here=$(cd "$(dirname "$0")" && pwd)
out=$here/signatures
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
mkdir -p "$out"

ds=http://www.w3.org/2000/09/xmldsig#
more=http://www.w3.org/2001/04/xmldsig-more#
enc=http://www.w3.org/2001/04/xmlenc#
exclusive=http://www.w3.org/2001/10/xml-exc-c14n#
inclusive=http://www.w3.org/TR/2001/REC-xml-c14n-20010315
saml=urn:oasis:names:tc:SAML:2.0:assertion

make_key() {
  openssl genpkey -quiet "$@" -out "$work/key.pem" 2>/dev/null ||
    openssl genpkey "$@" -out "$work/key.pem" 2>/dev/null
}

# certify NAME: writes a certificate of the key that was created last.
certify() {
  mv "$work/key.pem" "$work/$1.key"
  openssl req -x509 -new -key "$work/$1.key" -subj "/O=Test/CN=$1" -days 36500 -sha256 \
    -out "$out/$1.pem"
}

transform() { printf '<ds:Transform Algorithm="%s"/>' "$1"; }
enveloped=$(transform ${ds}enveloped-signature)

# Sets the parts of the next template to their defaults.
usual() {
  canonicalization=$exclusive
  method=${more}rsa-sha256
  uri='#_a1'
  transforms="$enveloped$(transform $exclusive)"
  digest=${enc}sha256
  subject='<saml:Subject><saml:NameID>user@example</saml:NameID></saml:Subject>'
  key_info='<ds:KeyInfo><ds:X509Data><ds:X509Certificate/></ds:X509Data></ds:KeyInfo>'
}

# assertion: prints the template with these parts.
assertion() {
  printf '%s' "<saml:Assertion xmlns:saml=\"$saml\" ID=\"_a1\" Version=\"2.0\">" \
    '<saml:Issuer>sts</saml:Issuer>' \
    "<ds:Signature xmlns:ds=\"$ds\"><ds:SignedInfo>" \
    "<ds:CanonicalizationMethod Algorithm=\"$canonicalization\"/>" \
    "<ds:SignatureMethod Algorithm=\"$method\"/>" \
    "<ds:Reference URI=\"$uri\"><ds:Transforms>$transforms</ds:Transforms>" \
    "<ds:DigestMethod Algorithm=\"$digest\"/><ds:DigestValue/></ds:Reference></ds:SignedInfo>" \
    "<ds:SignatureValue/>$key_info</ds:Signature>" \
    "$subject</saml:Assertion>"
}

# sign KEY FILE: signs the standard input with xmlsec1 and verifies the result with it.
sign() {
  cat > "$work/template.xml"
  xmlsec1 --sign --privkey-pem "$work/$1.key,$out/$1.pem" \
    --id-attr:ID "$saml:Assertion" --output "$out/$2" "$work/template.xml" 2> "$work/log" ||
    { cat "$work/log" >&2; exit 1; }
  xmlsec1 --verify --enabled-key-data x509 --trusted-pem "$out/$1.pem" \
    --id-attr:ID "$saml:Assertion" "$out/$2" 2> "$work/log" ||
    { cat "$work/log" >&2; exit 1; }
}

# alter FILE EXPRESSION: writes valid.xml to FILE, edited by sed with EXPRESSION.
alter() {
  sed "$2" "$out/valid.xml" > "$out/$1"
  if cmp -s "$out/valid.xml" "$out/$1"; then
    echo "nothing altered: $1" >&2
    exit 1
  fi
}

make_key -algorithm RSA -pkeyopt rsa_keygen_bits:2048
certify signer
make_key -algorithm RSA -pkeyopt rsa_keygen_bits:2048
certify stranger
make_key -algorithm RSA -pkeyopt rsa_keygen_bits:1024
certify weak
make_key -algorithm EC -pkeyopt ec_paramgen_curve:P-521
certify p521

usual
assertion | sign signer valid.xml
assertion | sign stranger strangers-key.xml
assertion | sign weak rsa-1024.xml

usual
method=${more}ecdsa-sha512
assertion | sign p521 valid-ecdsa-p521.xml

usual
canonicalization=$inclusive
transforms="$enveloped$(transform $inclusive)"
assertion | sign signer valid-inclusive.xml

usual
uri=
assertion | sign signer valid-whole-document.xml

usual
transforms=$enveloped
assertion | sign signer valid-no-canonicalization.xml

# Line ends and white space in attributes are signed as an XML parser normalises them.
usual
subject=$(printf '<saml:Subject tab="a\tb" reference="a&#9;b&#10;c&#13;d">\r\nline&#13;\r\nend</saml:Subject>')
assertion | sign signer valid-line-ends.xml
sed 's/$/\r/' "$out/valid-line-ends.xml" > "$work/line-ends.xml"
mv "$work/line-ends.xml" "$out/valid-line-ends.xml"

usual
# No ampersand: libxml2 does not resolve a reference to one in a namespace URI.
subject='<p:Subject xmlns:p="urn:'"'x'"'y" p:a="&lt;&quot;&gt;&amp;">]]&gt;"</p:Subject>'
assertion | sign signer valid-namespace-with-apostrophes.xml

usual
digest=${ds}sha1
assertion | sign signer sha1-digest.xml

usual
method=${ds}rsa-sha1
assertion | sign signer sha1-signature.xml

usual
transforms="$enveloped<ds:Transform Algorithm=\"http://www.w3.org/TR/1999/REC-xpath-19991116\">"
transforms="$transforms<ds:XPath>not(self::*[local-name()='Subject'])</ds:XPath></ds:Transform>"
assertion | sign signer xpath-hides-subject.xml

usual
transforms="$enveloped<ds:Transform Algorithm=\"http://www.w3.org/TR/1999/REC-xslt-19991116\">"
transforms="$transforms<xsl:stylesheet version=\"1.0\""
transforms="$transforms xmlns:xsl=\"http://www.w3.org/1999/XSL/Transform\">"
transforms="$transforms<xsl:template match=\"/\"><x/></xsl:template></xsl:stylesheet>"
transforms="$transforms</ds:Transform>"
assertion | sign signer xslt-hides-everything.xml

alter changed-subject.xml 's/user@example/root@example/'
alter comment-in-digest-value.xml 's/<ds:DigestValue>/&<!---->/'
alter instruction-in-signature-value.xml 's/<ds:SignatureValue>/&<?x y?>/'
alter second-signed-info.xml 's/<ds:SignedInfo>.*<\/ds:SignedInfo>/&&/'
alter signed-info-in-object.xml \
  's/<ds:SignedInfo>.*<\/ds:SignedInfo>/<ds:Object>&<\/ds:Object>&/'
alter second-id.xml 's/<saml:Subject>/<saml:Subject Id="_a1">/'
alter upper-case-algorithm.xml 's/rsa-sha256/RSA-SHA256/'
alter hmac-algorithm.xml 's/rsa-sha256/hmac-sha256/'
alter retrieval-method.xml 's/<ds:X509Data>/<ds:RetrievalMethod URI="file:\/\/\/dev\/null"\/>&/'
