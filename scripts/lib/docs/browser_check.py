#!/usr/bin/python3
"""Looks at a site in Chromium: browser_check.py SITE SCREENSHOTS

Opens pages at two widths from a server on this machine, and again as files, and uses the search. A page fails for a
message on the console, a request that fails or leaves this machine, and content that is wider than the window.
Screenshots are written for people to look at.
"""
import base64
import fcntl
import http.server
import json
import os
import select
import shutil
import subprocess
import sys
import tempfile
import threading
import time
from pathlib import Path

# Besides all pages of the manual
PAGES = ["api/index.html", "api/access/token_gate.html", "api/ssoclient/saml_token.html", "decisions/index.html"]
WIDTHS = [400, 1400]
# What is searched, and a page that must be among the results
SEARCHES = [("CreateTokenGate", "api/access/token_gate.html"), ("wrong password", "guide.html")]
SECONDS = 20
FLAGS = ["--headless", "--no-sandbox", "--disable-gpu", "--disable-quic", "--no-first-run",
         "--disable-background-networking", "--disable-component-update", "--disable-sync", "--disable-dev-shm-usage",
         "--hide-scrollbars", "--no-default-browser-check", "--remote-debugging-pipe"]


class Failure(Exception):
    pass


class Browser:
    """Chromium, by its debugging protocol over two pipes: one JSON object after another, each ended by a NUL."""

    def __init__(self, profile):
        program = shutil.which("chromium")
        if not program:
            raise Failure("Chromium is not installed.")
        from_here, self.commands = os.pipe()
        self.answers, to_here = os.pipe()
        # Chromium expects its pipes as the descriptors 3 and 4. The ends are moved above them first.
        high = [fcntl.fcntl(fd, fcntl.F_DUPFD, 10) for fd in (from_here, to_here)]
        script = f'exec 3<&{high[0]} 4>&{high[1]} {high[0]}<&- {high[1]}>&-; exec "$@"'
        self.process = subprocess.Popen(
            ["bash", "-c", script, "bash", program, *FLAGS, f"--user-data-dir={profile}", "about:blank"],
            pass_fds=high, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        for fd in (from_here, to_here, *high):
            os.close(fd)
        self.buffer, self.number, self.events = b"", 0, []
        target = self.call("Target.createTarget", url="about:blank")["targetId"]
        self.session = None
        self.session = self.call("Target.attachToTarget", targetId=target, flatten=True)["sessionId"]
        for domain in ("Page", "Runtime", "Log", "Network"):
            self.call(f"{domain}.enable")

    def receive(self, deadline):
        while b"\0" not in self.buffer:
            ready, _, _ = select.select([self.answers], [], [], max(0, deadline - time.monotonic()))
            if not ready:
                raise Failure("Chromium did not answer in time.")
            data = os.read(self.answers, 1 << 16)
            if not data:
                raise Failure("Chromium ended.")
            self.buffer += data
        message, _, self.buffer = self.buffer.partition(b"\0")
        return json.loads(message)

    def call(self, method, **parameters):
        self.number += 1
        message = {"id": self.number, "method": method, "params": parameters}
        if getattr(self, "session", None):
            message["sessionId"] = self.session
        os.write(self.commands, json.dumps(message).encode() + b"\0")
        deadline = time.monotonic() + SECONDS
        while True:
            answer = self.receive(deadline)
            if answer.get("id") == self.number:
                if "error" in answer:
                    raise Failure(f"{method}: {answer['error']['message']}")
                return answer["result"]
            self.events.append(answer)

    def wait_for(self, expression):
        """The value of an expression in the page, once it is true."""
        deadline = time.monotonic() + SECONDS
        while True:
            result = self.call("Runtime.evaluate", expression=expression, returnByValue=True)
            if "exceptionDetails" in result:
                raise Failure(f"{expression}: {result['exceptionDetails']['text']}")
            if result["result"].get("value"):
                return result["result"]["value"]
            if time.monotonic() > deadline:
                url = self.call("Runtime.evaluate", expression="location.href", returnByValue=True)["result"]["value"]
                raise Failure(f"{url}: never true: {expression}")
            time.sleep(0.03)

    def open(self, url, width):
        self.call("Emulation.setDeviceMetricsOverride", width=width, height=900, deviceScaleFactor=1, mobile=False)
        self.call("Page.navigate", url="about:blank")
        self.wait_for("location.href === 'about:blank'")
        self.call("Storage.clearDataForOrigin", origin=url.rsplit("/", 1)[0], storageTypes="local_storage")
        self.events.clear()
        self.call("Page.navigate", url=url)
        self.wait_for(f"location.href.startsWith({json.dumps(url)}) && document.readyState === 'complete'")

    def screenshot(self, path, whole=False):
        data = self.call("Page.captureScreenshot", format="png", captureBeyondViewport=whole)["data"]
        path.write_bytes(base64.b64decode(data))

    def close(self):
        self.session = None
        self.call("Browser.close")
        self.process.wait(SECONDS)


def complaints(events, base):
    """What went wrong in a page since it was opened."""
    urls = {}
    for event in events:
        method, parameters = event.get("method"), event.get("params", {})
        if method == "Network.requestWillBeSent":
            url = parameters["request"]["url"]
            urls[parameters["requestId"]] = url
            if not url.startswith((base, "data:", "about:", "blob:")):
                yield f"requests {url}"
        elif method == "Network.loadingFailed" and not parameters.get("canceled"):
            yield f"{urls.get(parameters['requestId'])}: {parameters['errorText']}"
        elif method == "Network.responseReceived" and parameters["response"]["status"] >= 400:
            yield f"{parameters['response']['url']}: status {parameters['response']['status']}"
        elif method == "Runtime.exceptionThrown":
            details = parameters["exceptionDetails"]
            yield details.get("exception", {}).get("description", details["text"])
        elif method == "Runtime.consoleAPICalled" and parameters["type"] in ("error", "warning", "assert"):
            yield "console: " + " ".join(str(argument.get("value")) for argument in parameters["args"])
        elif method == "Log.entryAdded" and parameters["entry"]["level"] in ("error", "warning"):
            yield f"log: {parameters['entry']['text']}"


class Handler(http.server.SimpleHTTPRequestHandler):
    def log_message(self, *arguments):
        pass


class Check:
    def __init__(self, browser, site, screenshots):
        self.browser, self.site, self.screenshots = browser, site, screenshots
        self.failures, self.count = [], 0

    def finish(self, page, width, base):
        self.count += 1
        self.failures += [f"{base}{page} at {width}: {why}" for why in complaints(self.browser.events, base)]

    def look(self, base, page, width, scheme):
        browser = self.browser
        browser.call("Emulation.setEmulatedMedia", features=[{"name": "prefers-color-scheme", "value": scheme}])
        browser.open(base + page, width)
        browser.wait_for("document.querySelector('article h1').getBoundingClientRect().width > 0")
        widest = browser.wait_for("document.documentElement.scrollWidth")
        if widest > width:
            self.failures.append(f"{page}: {widest} pixels wide in a window of {width}")
        name = f"{page.replace('/', '-').removesuffix('.html')}-{width}-{scheme}.png"
        browser.screenshot(self.screenshots / name)
        self.finish(page, width, base)

    def search(self, base, text, expected, width):
        browser = self.browser
        browser.open(base + "index.html", width)
        browser.call("Runtime.evaluate", expression="document.querySelector('.md-search__input').focus()")
        # What is typed before the index has been read would not be searched.
        browser.wait_for("document.querySelector('.md-search-result__meta').textContent.includes('Type to start')")
        for character in text:
            browser.call("Input.dispatchKeyEvent", type="keyDown", text=character)
            browser.call("Input.dispatchKeyEvent", type="keyUp")
        found = f"[...document.querySelectorAll('.md-search-result__link')].some(a => a.href.includes({expected!r}))"
        browser.wait_for(found)
        kind = "file" if base.startswith("file:") else "http"
        browser.screenshot(self.screenshots / f"search-{kind}-{width}.png")
        self.finish(f"search for {text}", width, base)

    def run(self):
        server = http.server.ThreadingHTTPServer(
            ("127.0.0.1", 0), lambda *arguments: Handler(*arguments, directory=str(self.site)))
        threading.Thread(target=server.serve_forever, daemon=True).start()
        base = f"http://127.0.0.1:{server.server_port}/"
        pages = sorted(path.name for path in self.site.glob("*.html")) + PAGES
        for width in WIDTHS:
            for page in pages:
                self.look(base, page, width, "light")
            self.look(base, "index.html", width, "dark")
            for text, expected in SEARCHES:
                self.search(base, text, expected, width)
        files = self.site.as_uri() + "/"
        self.look(files, "guide.html", 1400, "light")
        self.search(files, *SEARCHES[0], 1400)
        server.shutdown()


def main(site, screenshots):
    screenshots = Path(screenshots)
    shutil.rmtree(screenshots, ignore_errors=True)
    screenshots.mkdir(parents=True)
    with tempfile.TemporaryDirectory(ignore_cleanup_errors=True) as profile:
        browser = Browser(profile)
        check = Check(browser, Path(site).resolve(), screenshots)
        try:
            check.run()
        except Failure as failure:
            check.failures.append(str(failure))
        browser.close()
    for failure in check.failures:
        print(failure, file=sys.stderr)
    print(f"{check.count} pages and searches in Chromium, {len(check.failures)} failures; see {screenshots}")
    return 1 if check.failures else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
