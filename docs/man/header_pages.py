#!/usr/bin/env python3
"""Writes the manual page of each public header, morwick_NAME.3, out of the header itself: the comment of
the file, then each declaration with its own. The date is that of the library's page.
Usage: header_pages.py FOLDER LIBRARY_PAGE HEADER..."""

import re
import sys
from pathlib import Path


def escaped(text):
    return re.sub(r"(?m)^(?=[.'])", r"\\&", text.replace("\\", "\\e").replace("-", "\\-"))


def literal(code, offset=""):
    return f".Bd -literal{offset}\n{escaped(code)}\n.Ed\n"


def prose(comment):
    """Paragraphs, one sentence a line; those that are indented stay as they are."""
    page = ""
    text = re.sub(r"(?m)^(/\*| \*/?) ?| ?\*/$", "", comment).strip("\n")
    for paragraph in text.split("\n\n"):
        if paragraph.startswith("    "):
            page += literal(re.sub("(?m)^    ", "", paragraph), " -offset indent")
        else:
            sentences = re.sub(r"(?<=[.?!:]) (?=[A-Z])", "\n", " ".join(paragraph.split()))
            # No hyphen within a name such as bytesPerPage at the end of a line.
            whole = re.sub(r"\b(?=\w*[a-z][A-Z])", r"\\%", escaped(sentences))
            page += ".Pp\n" + re.sub("`(.*?)`", r"\\fI\1\\fP", whole) + "\n"
    return page


def declaration(code):
    """What a user of the library sees: no export mark, no body. The mark has 15 characters."""
    code = re.sub(r"(?ms)^static inline (.*?) \{\n.*?^\}$", r"\1;", code)
    return re.sub(r"(?m)^MORWICK_EXPORT ", "", re.sub(r"\n {15}(?= )", "\n", code))


def page(header, date, pages):
    source = re.sub(r"(?s)/\*@.*?\*/\n+", "", header.read_text(encoding="utf-8"))  # annotations for the prover
    chunks = [re.fullmatch(r"(?s)(/\*.*?\*/|)\s*(.*)", chunk).groups()
              for chunk in re.split(r"\n{2,}(?=\S)", source.strip())]
    about = chunks[0][0]
    names, description = [f"morwick_{header.stem}"], prose(about)
    for comment, code in chunks[1:]:
        if re.match(r"#include|#ifdef __cplusplus|#endif|\}", code):
            continue
        names += re.findall(r"(?m)^(?:MORWICK_EXPORT|static inline) [^;{(\[]*?(\w+)[;(\[]", code)
        if not code:
            description += prose(comment)
        else:
            description += literal(declaration(code))
            description += f".Bl -item -offset indent\n.It\n{prose(comment)}.El\n" if comment else ""
    also = {f"morwick_{name}" for name in re.findall(r"(\w+)\.h\b", source)} & pages
    summary = re.search(r"\w[^.,:;]*", prose(about).removeprefix(".Pp\n"))[0]
    text = "\n".join([
        date, f".Dt {names[0].upper()} 3", ".Os", ".Sh NAME",
        " ,\n".join(f".Nm {name}" for name in names), f".Nd {summary}",
        ".Sh SYNOPSIS", f".In morwick/{header.name}",
        ".Sh DESCRIPTION", description.strip(),
        ".Sh SEE ALSO", " ,\n".join(f".Xr {name} 3" for name in ["libmorwick", *sorted(also - {names[0], "morwick_export"})]), ""])
    return re.sub(r"(?m)^(\.(?:Sh|It).*\n)\.Pp\n", r"\1", text)


def main(folder, library_page, *headers):
    headers = [Path(header) for header in headers]
    date = Path(library_page).read_text(encoding="utf-8").splitlines()[0]
    pages = {f"morwick_{header.stem}" for header in headers}
    for header in headers:
        path = Path(folder) / f"morwick_{header.stem}.3"
        path.write_text(page(header, date, pages), encoding="utf-8")


main(*sys.argv[1:])
