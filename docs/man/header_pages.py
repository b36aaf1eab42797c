#!/usr/bin/env python3
"""Writes the manual page of each public header, morwick_NAME.3, from the header itself: the comment of
the file, then each declaration, followed by its own comment. The date is that of the library's page.
Usage: header_pages.py FOLDER LIBRARY_PAGE HEADER...

A header must have this layout. Blank lines separate its parts, each a comment, a declaration, or a comment
right above its declaration. Parts that begin with #endif or ask for the compiler (#ifdef __NAME) are left
out. The first part is the comment of the file. It begins with the page's summary, which ends at the first
. , : or ;. In comments, code is indented by four. The name that an exported declaration gives stands right
before its first bracket or semicolon. A body is one line, or ends with "}" in column 1."""

import re
import sys
from pathlib import Path


def escaped(text):
    return re.sub(r"(?m)^(?=[.'])", r"\\&", text.replace("\\", "\\e").replace("-", "\\-"))


def literal(code, offset=""):
    return f".Bd -literal{offset}\n{escaped(code)}\n.Ed\n"


def prose(comment):
    """A comment as paragraphs, one sentence a line. Indented ones are code and stay as they are."""
    paragraphs = ""
    # Without the comment marks and the star of each line.
    text = re.sub(r"(?m)^(/\*| \*/?) ?| ?\*/$", "", comment).strip("\n")
    for paragraph in text.split("\n\n"):
        if paragraph.startswith("    "):
            paragraphs += literal(re.sub("(?m)^    ", "", paragraph), " -offset indent")
        else:
            sentences = re.sub(r"(?<=[.?!:]) (?=[A-Z])", "\n", " ".join(paragraph.split()))
            # Keeps a name such as bytesPerPage from being hyphenated at the end of a line.
            whole = re.sub(r"\b(?=\w*[a-z][A-Z])", r"\\%", escaped(sentences))
            paragraphs += ".Pp\n" + re.sub("`(.*?)`", r"\\fI\1\\fP", whole) + "\n"
    return paragraphs


def declaration(code):
    """Code without export marks and bodies. Continued lines move left by the mark's 15 characters."""
    code = re.sub(r"(?ms)^static inline ([^{]*) \{(?:[^\n]+|\n.*?^)\}$", r"\1;", code)
    return re.sub(r"(?m)^MORWICK_EXPORT ", "", re.sub(r"\n {15}(?= )", "\n", code))


def page(header, date, pages):
    source = re.sub(r"(?s)/\*@.*?\*/\n+", "", header.read_text(encoding="utf-8"))  # annotations for the prover
    parts = [re.fullmatch(r"(?s)(/\*.*?\*/|)\s*(.*)", part).groups()  # comment and code
             for part in re.split(r"\n{2,}(?=\S)", source.strip())]
    about = parts[0][0]
    names, description = [f"morwick_{header.stem}"], prose(about)
    for comment, code in parts[1:]:
        if re.match(r"#include|#if\w+ __|#endif|\}", code):
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
    # No paragraph begins right after a heading or at the start of an item.
    return re.sub(r"(?m)^(\.(?:Sh|It).*\n)\.Pp\n", r"\1", text)


def main(folder, library_page, *headers):
    headers = [Path(header) for header in headers]
    date = Path(library_page).read_text(encoding="utf-8").splitlines()[0]
    pages = {f"morwick_{header.stem}" for header in headers}
    for header in headers:
        path = Path(folder) / f"morwick_{header.stem}.3"
        path.write_text(page(header, date, pages), encoding="utf-8")


main(*sys.argv[1:])
