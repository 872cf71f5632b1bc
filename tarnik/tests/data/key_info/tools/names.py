"""Prints the subjects of certificates as python3-cryptography writes them: names.py CERTIFICATE..."""
import sys

from cryptography import x509

for number, path in enumerate(sys.argv[1:], 1):
    with open(path, "rb") as file:
        subject = x509.load_pem_x509_certificate(file.read()).subject
    print(f"{number:02d}\tpython\t{subject.rfc4514_string()}")
