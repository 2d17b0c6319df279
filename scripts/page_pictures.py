#!/usr/bin/env python3
"""Pictures of a report page for the README, taken in headless Chromium.

usage: page_pictures.py PAGE DIRECTORY
Writes page.png, one section as a desktop shows it, and page-phone.png, the same on a phone.
Needs the Debian packages chromium, chromium-driver and python3-selenium.
"""

import base64
import shutil
import sys
import tempfile
from pathlib import Path

try:
    from selenium import webdriver
    from selenium.webdriver.chrome.service import Service
except ImportError:
    sys.exit("page_pictures: the Python package selenium is missing (Debian: python3-selenium)")

SWITCHES = [
    "--headless=new",
    "--no-sandbox",
    "--disable-gpu",
    "--disable-quic",
    "--no-first-run",
    "--disable-background-networking",
    "--disable-component-update",
    "--disable-sync",
]
SECTION = "sound-3"  # the concert hall in the demo's tour
# File, width, and height shown, in CSS pixels; pixels of the picture to one of these.
PICTURES = [("page.png", 1000, 1200, 1), ("page-phone.png", 390, 1320, 1)]


def take(browser, page, width, height, scale):
    browser.execute_cdp_cmd(
        "Emulation.setDeviceMetricsOverride",
        {"width": width, "height": 800, "deviceScaleFactor": scale, "mobile": width < 600},
    )
    browser.get(page)
    top = browser.execute_script(
        "return document.getElementById(arguments[0]).getBoundingClientRect().top + scrollY",
        SECTION,
    )
    clip = {"x": 0, "y": top - 16, "width": width, "height": height, "scale": 1}
    shot = browser.execute_cdp_cmd(
        "Page.captureScreenshot", {"captureBeyondViewport": True, "clip": clip}
    )
    return base64.b64decode(shot["data"])


def main():
    if len(sys.argv) != 3 or not Path(sys.argv[1]).is_file():
        sys.exit(__doc__.strip())
    page, directory = Path(sys.argv[1]).resolve(), Path(sys.argv[2])
    for program in ("chromium", "chromedriver"):
        if shutil.which(program) is None:
            sys.exit(f"page_pictures: {program} is missing")
    options = webdriver.ChromeOptions()
    options.binary_location = shutil.which("chromium")
    with tempfile.TemporaryDirectory(ignore_cleanup_errors=True) as profile:
        for switch in [*SWITCHES, f"--user-data-dir={profile}"]:
            options.add_argument(switch)
        browser = webdriver.Chrome(service=Service(shutil.which("chromedriver")), options=options)
        try:
            for name, width, height, scale in PICTURES:
                (directory / name).write_bytes(take(browser, page.as_uri(), width, height, scale))
        finally:
            browser.quit()


if __name__ == "__main__":
    main()
