"""The resources and headers of the Windows programs and the DLL."""

import re
from xml.etree import ElementTree

import pefile
import pytest

from conftest import BUILD, TREE

RT_MANIFEST = pefile.RESOURCE_TYPE["RT_MANIFEST"]
VERSION = re.search(r"^project\(assay VERSION (\S+)", (TREE / "CMakeLists.txt").read_text(),
                    re.MULTILINE).group(1)


PROGRAMS = ["assay.exe", "assay-host.exe"]
FILES = [*PROGRAMS, "assay-host.dll"]


def image_of(file):
    return pefile.PE(str(BUILD / "bin" / file))


def manifests_of(image):
    for kind in image.DIRECTORY_ENTRY_RESOURCE.entries:
        if kind.id == RT_MANIFEST:
            for name in kind.directory.entries:
                for language in name.directory.entries:
                    place = language.data.struct
                    yield name.id, image.get_data(place.OffsetToData, place.Size)


@pytest.mark.parametrize("program", PROGRAMS)
def test_manifest(program):
    [(number, text)] = manifests_of(image_of(program))
    assert number == 1
    root = ElementTree.fromstring(text)
    values = {element.tag.split("}")[1]: element.text for element in root.iter()}
    assert values["activeCodePage"] == "UTF-8"
    assert values["longPathAware"] == "true"
    assert values["dpiAwareness"].startswith("PerMonitorV2")
    [level] = [element for element in root.iter()
               if element.tag.endswith("}requestedExecutionLevel")]
    assert level.get("level") == "asInvoker"
    systems = {element.get("Id") for element in root.iter()
               if element.tag.endswith("}supportedOS")}
    assert "{8e0f7a12-bfb3-4fe8-b9a5-48fd50a15a9a}" in systems, "Windows 10 and 11"


def test_dll_has_no_manifest():
    """A program has its own; one of a DLL would have the number 2."""
    assert not list(manifests_of(image_of("assay-host.dll")))


@pytest.mark.parametrize("file", FILES)
def test_version(file):
    image = image_of(file)
    numbers = [int(part) for part in VERSION.split(".")] + [0]
    [fixed] = image.VS_FIXEDFILEINFO
    assert [fixed.FileVersionMS >> 16, fixed.FileVersionMS & 0xFFFF,
            fixed.FileVersionLS >> 16, fixed.FileVersionLS & 0xFFFF] == numbers
    assert fixed.FileType == (1 if file.endswith(".exe") else 2)
    texts = {key.decode(): value.decode() for info in image.FileInfo[0]
             if info.Key == b"StringFileInfo" for table in info.StringTable
             for key, value in table.entries.items()}
    assert texts["ProductName"] == "assay"
    assert texts["ProductVersion"] == texts["FileVersion"] == VERSION
    assert texts["OriginalFilename"] == file
    assert texts["FileDescription"]


@pytest.mark.parametrize("file", FILES)
def test_addresses_and_data_are_protected(file):
    header = image_of(file).OPTIONAL_HEADER
    assert header.IMAGE_DLLCHARACTERISTICS_DYNAMIC_BASE
    assert header.IMAGE_DLLCHARACTERISTICS_HIGH_ENTROPY_VA
    assert header.IMAGE_DLLCHARACTERISTICS_NX_COMPAT
