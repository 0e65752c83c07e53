# SPDX-License-Identifier: Apache-2.0
"""CIM-XML over HTTP, HTTPS and the Unix socket."""
import base64
import http.client
import socket
import ssl
import xml.etree.ElementTree as ET

from tally import Wrong, expect

WAYS = ("HTTP", "HTTPS", "the Unix socket")
PATIENCE = 60  # seconds; longer than a busy machine takes
MESSAGE = """<?xml version="1.0" encoding="utf-8"?>
<CIM CIMVERSION="2.0" DTDVERSION="2.0"><MESSAGE ID="{id}" PROTOCOLVERSION="1.0"><SIMPLEREQ><IMETHODCALL NAME="{name}">\
<LOCALNAMESPACEPATH><NAMESPACE NAME="root"/><NAMESPACE NAME="cimv2"/></LOCALNAMESPACEPATH>{parameters}</IMETHODCALL>\
</SIMPLEREQ></MESSAGE></CIM>"""


class CimError(Wrong):
    """The error of an answer."""

    def __init__(self, error):
        super().__init__(f"CIM error {error.get('CODE')}: {error.get('DESCRIPTION')}")
        self.code = int(error.get("CODE"))


class _UnixConnection(http.client.HTTPConnection):
    def connect(self):
        self.sock = socket.socket(socket.AF_UNIX)
        self.sock.settimeout(PATIENCE)
        self.sock.connect(self.host)


def connect(life, way, address="127.0.0.1"):
    if way == "the Unix socket":
        return _UnixConnection(life.socket, 80)
    if way == "HTTP":
        return http.client.HTTPConnection("127.0.0.1", life.http, PATIENCE, (address, 0))
    return http.client.HTTPSConnection("127.0.0.1", life.https, timeout=PATIENCE, source_address=(address, 0),
                                       context=ssl.create_default_context(cafile=life.certificate))


def headers_for(user, password):
    return {"Host": "localhost", "Content-Type": "application/xml", "CIMOperation": "MethodCall",
            "Authorization": "Basic " + base64.b64encode(f"{user}:{password}".encode()).decode()}


def post(connection, body, user="admin", password="admin"):
    """Status and body of the answer."""
    connection.request("POST", "/cimom", body, headers_for(user, password))
    answer = connection.getresponse()
    return answer.status, answer.read()


def request(name, of_class=None, number="1", **parameters):
    if of_class:
        parameters["ClassName"] = f'<CLASSNAME NAME="{of_class}"/>'
    given = "".join(f'<IPARAMVALUE NAME="{key}">{value if value[0] == "<" else f"<VALUE>{value}</VALUE>"}</IPARAMVALUE>'
                    for key, value in parameters.items())
    return MESSAGE.format(id=number, name=name, parameters=given).encode()


def call(connection, name, of_class=None, **parameters):
    """The answer to a request that has to be understood; CimError when it is refused."""
    number = str(id(connection))
    status, answer = post(connection, request(name, of_class, number, **parameters))
    expect(status == 200, f"{name} was answered {status}: {answer[:200]!r}")
    parsed = ET.fromstring(answer).find("MESSAGE")
    expect(parsed.get("ID") == number, "the answer is to another message")
    if (error := parsed.find(".//ERROR")) is not None:
        raise CimError(error)
    return parsed


def paths_in(answer):
    return [ET.tostring(path, "unicode") for path in answer.iter("INSTANCENAME")]
