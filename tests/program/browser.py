"""Pages in headless Chromium, with all that it says of them."""

import json
import shutil
from contextlib import contextmanager
from pathlib import Path

import pytest

from harness import TREE

webdriver = pytest.importorskip("selenium.webdriver", reason="python3-selenium isn't there")
from selenium.webdriver.chrome.service import Service  # noqa: E402

# scripts/deps puts it there, if npm is there.
AXE = TREE / "build" / "node" / "node_modules" / "axe-core" / "axe.min.js"
DRIVER = shutil.which("chromedriver")


class Browser:
    """One window."""

    def __init__(self, driver):
        self.driver = driver

    def open(self, file, width=1280, scheme="light", media="screen"):
        """Loads the file in a window of this width, in a colour scheme, for a screen or as "print"."""
        self.command("Emulation.setEmulatedMedia", media=media,
                     features=[{"name": "prefers-color-scheme", "value": scheme}])
        self.command("Emulation.setDeviceMetricsOverride",
                     width=width, height=900, deviceScaleFactor=1, mobile=False)
        self.driver.get_log("browser")
        self.driver.get_log("performance")
        self.driver.get(Path(file).resolve().as_uri())

    def command(self, name, **parameters):
        return self.driver.execute_cdp_cmd(name, parameters)

    def run(self, script, *arguments):
        return self.driver.execute_script(script, *arguments)

    def console(self):
        """The messages since the page was opened."""
        return [entry["message"] for entry in self.driver.get_log("browser")]

    def requests(self):
        """The addresses that were asked for since the page was opened."""
        events = [json.loads(entry["message"])["message"] for entry in self.driver.get_log("performance")]
        return [event["params"]["request"]["url"] for event in events
                if event["method"] == "Network.requestWillBeSent"]

    def outline(self):
        """The landmarks, headings and terms of the page, in order, each with its depth."""
        return self.run("""
            const lines = [];
            const visit = (node, depth) => {
                for (const child of node.children) {
                    const name = child.tagName.toLowerCase();
                    const named = ["h1", "h2", "h3", "dt", "summary", "caption", "th", "button"].includes(name);
                    if (named)
                        lines.push(" ".repeat(depth) + name + " " + child.textContent);
                    else if (["header", "main", "footer", "article"].includes(name))
                        lines.push(" ".repeat(depth) + name);
                    visit(child, ["header", "main", "footer", "article"].includes(name) ? depth + 1 : depth);
                }
            };
            visit(document.body, 0);
            return lines;""")

    def violations(self):
        """What an audit of accessibility finds, by the WCAG rules of level A and AA."""
        if not AXE.exists():
            pytest.skip("axe-core isn't there: scripts/deps test installs it where npm is")
        self.run(AXE.read_text(encoding="utf-8"))
        found = self.driver.execute_async_script("""
            const done = arguments[arguments.length - 1];
            axe.run({runOnly: ["wcag2a", "wcag2aa", "wcag21a", "wcag21aa", "wcag22aa", "best-practice"]})
                .then(result => done({violations: result.violations, passes: result.passes.length}));""")
        assert found["passes"] > 10
        return [f"{each['id']}: {[node['html'][:120] for node in each['nodes']]}" for each in found["violations"]]

    def picture(self, file):
        """Saves the whole page."""
        size = self.command("Page.getLayoutMetrics")["cssContentSize"]
        self.command("Emulation.setDeviceMetricsOverride", width=size["width"], height=size["height"],
                     deviceScaleFactor=1, mobile=False)
        self.driver.save_screenshot(str(file))


@contextmanager
def browser():
    if not DRIVER:
        pytest.skip("chromium-driver isn't there")
    options = webdriver.ChromeOptions()
    # A container has neither the sandbox's namespaces nor much shared memory. Nothing of a page needs more.
    for option in ("--headless=new", "--no-sandbox", "--disable-dev-shm-usage", "--disable-gpu",
                   "--hide-scrollbars", "--force-color-profile=srgb"):
        options.add_argument(option)
    options.set_capability("goog:loggingPrefs", {"browser": "ALL", "performance": "ALL"})
    driver = webdriver.Chrome(service=Service(DRIVER), options=options)
    try:
        yield Browser(driver)
    finally:
        driver.quit()


__all__ = ["AXE", "Browser", "browser"]
