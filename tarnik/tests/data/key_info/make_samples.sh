#!/bin/sh
# Recreates the samples in this folder with new keys. Needs the Debian packages openssl, xmlsec1, libxml2-utils,
# gnutls-bin, openjdk-17-jdk-headless and python3-cryptography, and node with npm, which downloads the package xml-crypto
# with its dependency @xmldom/xmldom.
set -eu

out=$(cd "$(dirname "$0")" && pwd)
tools=$out/tools
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
rm -f "$out"/*.xml "$out"/*.pem "$out"/*.txt
cd "$work"

ds=http://www.w3.org/2000/09/xmldsig#
more=http://www.w3.org/2001/04/xmldsig-more#
exclusive=http://www.w3.org/2001/10/xml-exc-c14n#
saml=urn:oasis:names:tc:SAML:2.0:assertion

javac -d "$work" "$tools/Names.java" "$tools/Sign.java"
npm install --silent --no-save xml-crypto@6.3.2 > /dev/null

rsa='-algorithm RSA -pkeyopt rsa_keygen_bits:2048'
ec='-algorithm EC -pkeyopt ec_paramgen_curve:P-256'

# certify NAME KEY_OPTIONS SUBJECT [EXTENSION]: makes NAME.key, NAME.pk8 and $out/NAME.pem.
certify() {
  openssl genpkey $2 -out "$1.key" 2> log || { cat log >&2; exit 1; }
  openssl pkcs8 -topk8 -nocrypt -in "$1.key" -outform DER -out "$1.pk8"
  renew "$1" "$1" "$3" "${4-subjectKeyIdentifier=hash}"
}

# renew NAME KEY SUBJECT EXTENSION: makes $out/NAME.pem with the key KEY.key.
renew() {
  printf '[req]\ndistinguished_name=dn\n[dn]\n[ext]\n%s\n' "$4" > openssl.cnf
  openssl req -x509 -new -key "$2.key" -subj "$3" -utf8 -days 36500 -sha256 -config openssl.cnf \
    -extensions ext -out "$out/$1.pem"
}

# ---- names.pem and names.txt: 17 names, each in 9 spellings

names=$work/names
mkdir "$names"
subject() {
  count=$((${count:-0} + 1))
  number=$(printf %02d "$count")
  openssl genpkey $ec -out "$number.key" 2> log || { cat log >&2; exit 1; }
  printf 'oid_section=oids\n[oids]\ncustom=1.3.6.1.4.1.99999.1\n[req]\ndistinguished_name=dn\n[dn]\n' > openssl.cnf
  openssl req -x509 -new -key "$number.key" -subj "$1" -utf8 -days 36500 -sha256 -config openssl.cnf \
    -out "$names/$number.pem"
}
subject '/C=DE/ST=Bavaria/L=Munich/O=Example/OU=Security/CN=sts'
subject '/O=Example/CN=sts/emailAddress=admin@sts.example'
subject '/O=Example/CN=sts/serialNumber=HRB 4711'
subject '/C=DE/L=Berlin/street=Unter den Linden 1/postalCode=10117/O=Example/CN=sts'
subject '/O=Example, Inc./CN=sts'
subject '/O=a=b/CN=sts'
subject '/O=A \+ B/CN=sts'
subject '/O=The "Example" Company/CN=sts'
subject '/O=Example/CN=sts+serialNumber=1+OU=Login'
subject '/O=Prüfer und Söhne/CN=sts'
subject '/O=#1 Company/OU=blanks  within/CN=sts'
subject '/O=a;b <c> d/CN=sts'
subject '/O=Example/CN=DOMAIN\\sts'
subject '/DC=example/DC=sts/OU=Users/CN=sts/UID=sts01'
subject '/C=DE/title=Dr./GN=Erika/SN=Mustermann/initials=EM/generationQualifier=III/dnQualifier=q1/pseudonym=em/CN=Erika'
subject '/O=Example/custom=text, with comma/CN=sts'
subject '/C=JP/O=例え/organizationIdentifier=NTRJP-1/businessCategory=Private Organization/CN=𝒮𝓉𝓈'

cat "$names"/*.pem > "$out/names.pem"
{
  java -cp "$work" Names "$names"/*.pem
  python3 "$tools/names.py" "$names"/*.pem
  for certificate in "$names"/*.pem; do
    number=$(basename "$certificate" .pem)
    printf '%s\topenssl\t' "$number"
    openssl x509 -in "$certificate" -noout -subject -nameopt RFC2253 | sed 's/^subject=//'
    printf '%s\tgnutls\t' "$number"
    certtool --certificate-info --infile "$certificate" | sed -n 's/^\tSubject: //p'
    printf '<a xmlns:ds="%s"><ds:Signature><ds:SignedInfo>%s%s<ds:Reference URI="">%s%s</ds:Reference></ds:SignedInfo>' \
      $ds "<ds:CanonicalizationMethod Algorithm=\"$exclusive\"/>" \
      "<ds:SignatureMethod Algorithm=\"${more}ecdsa-sha256\"/>" \
      "<ds:Transforms><ds:Transform Algorithm=\"${ds}enveloped-signature\"/></ds:Transforms>" \
      "<ds:DigestMethod Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/><ds:DigestValue/>" > template.xml
    printf '<ds:SignatureValue/><ds:KeyInfo><ds:X509Data><ds:X509SubjectName/></ds:X509Data></ds:KeyInfo></ds:Signature></a>' \
      >> template.xml
    xmlsec1 --sign --privkey-pem "$number.key,$certificate" --output signed.xml template.xml
    printf '%s\txmlsec1\t' "$number"
    xmllint --xpath "string(//*[local-name()='X509SubjectName'])" signed.xml
  done
} | LC_ALL=C sort > "$out/names.txt"

# ---- signatures

same='/C=DE/O=Example, Inc./CN=sts/emailAddress=admin@sts.example'
certify current "$rsa" "$same"
certify next "$rsa" "$same"
certify ec "$ec" '/O=Example \+ Söhne/CN=sts+serialNumber=7'
certify stranger "$rsa" "$same"
renew renewed current "$same" 'subjectKeyIdentifier=hash'

assertion() {
  printf '<saml:Assertion xmlns:saml="%s" ID="_a1" Version="2.0"><saml:Issuer>sts</saml:Issuer>%s%s</saml:Assertion>' \
    $saml "$1" '<saml:Subject><saml:NameID>user@example</saml:NameID></saml:Subject>'
}
assertion '' > unsigned.xml

# verify SIGNER FILE: with the key of the signer, whatever the KeyInfo says.
verify() {
  xmlsec1 --verify --enabled-key-data key-name --pubkey-cert-pem "$out/$1.pem" --id-attr:ID "$saml:Assertion" \
    "$out/$2" 2> log || { echo "$2" >&2; cat log >&2; exit 1; }
}

# by_java and by_xml_crypto SIGNER NAMED HINT FILE
by_java() {
  java -cp "$work" Sign unsigned.xml "$1.pk8" "$out/$1.pem" "$out/$2.pem" "$3" "$out/$4"
  verify "$1" "$4"
}
by_xml_crypto() {
  node "$tools/sign.cjs" unsigned.xml "$1.key" "$out/$1.pem" "$out/$2.pem" "$3" "$out/$4"
  verify "$1" "$4"
}

# by_xmlsec1 SIGNER METHOD KEY_INFO FILE
by_xmlsec1() {
  assertion "<ds:Signature xmlns:ds=\"$ds\"><ds:SignedInfo><ds:CanonicalizationMethod Algorithm=\"$exclusive\"/>\
<ds:SignatureMethod Algorithm=\"$more$2\"/><ds:Reference URI=\"#_a1\"><ds:Transforms>\
<ds:Transform Algorithm=\"${ds}enveloped-signature\"/><ds:Transform Algorithm=\"$exclusive\"/></ds:Transforms>\
<ds:DigestMethod Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"/><ds:DigestValue/></ds:Reference></ds:SignedInfo>\
<ds:SignatureValue/>$3</ds:Signature>" > template.xml
  xmlsec1 --sign --privkey-pem "$1.key,$out/$1.pem" --id-attr:ID "$saml:Assertion" --output "$out/$4" template.xml
  verify "$1" "$4"
}

for hint in key-value der-encoded-key-value x509-digest x509-ski x509-issuer-serial x509-subject-name key-name none; do
  by_java current current $hint java-$hint.xml
  by_java ec ec $hint java-ec-$hint.xml
done
for hint in key-value der-encoded-key-value x509-digest key-name none; do
  by_xml_crypto current current $hint xml-crypto-$hint.xml
done
x509() { printf '<ds:KeyInfo><ds:X509Data><ds:%s/></ds:X509Data></ds:KeyInfo>' "$1"; }
by_xmlsec1 current rsa-sha256 '<ds:KeyInfo><ds:KeyValue/></ds:KeyInfo>' xmlsec1-key-value.xml
by_xmlsec1 current rsa-sha256 "$(x509 X509SKI)" xmlsec1-x509-ski.xml
by_xmlsec1 current rsa-sha256 "$(x509 X509IssuerSerial)" xmlsec1-x509-issuer-serial.xml
by_xmlsec1 current rsa-sha256 "$(x509 X509SubjectName)" xmlsec1-x509-subject-name.xml
by_xmlsec1 current rsa-sha256 '<ds:KeyInfo><ds:KeyName>key of the sts</ds:KeyName></ds:KeyInfo>' xmlsec1-key-name.xml
by_xmlsec1 current rsa-sha256 '' xmlsec1-none.xml
by_xmlsec1 ec ecdsa-sha256 "$(x509 X509IssuerSerial)" xmlsec1-ec-x509-issuer-serial.xml
by_xmlsec1 ec ecdsa-sha256 "$(x509 X509SubjectName)" xmlsec1-ec-x509-subject-name.xml
by_xmlsec1 ec ecdsa-sha256 '' xmlsec1-ec-none.xml

# Signed by the stranger, who names his own key, or a trusted one.
for hint in key-value der-encoded-key-value x509-digest x509-ski none; do
  by_java stranger stranger $hint stranger-$hint.xml
done
for hint in key-value der-encoded-key-value x509-digest x509-ski x509-subject-name; do
  by_java stranger current $hint stranger-names-trusted-$hint.xml
done
