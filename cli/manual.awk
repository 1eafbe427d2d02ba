# Makes the manual page xquery(1) of docs/command.md: awk -v version=V -f manual.awk command.md
#
# Of Markdown it knows what that page is written in: headings, paragraphs, tables of two columns,
# blocks of code, `code` and [links](to).

# What roff would take for its own.
function plain(text) {
  gsub(/\\/, "\\e", text)
  gsub(/-/, "\\-", text)
  return text
}

# A piece of text between two back quotes is bold.
function styled(text,    link, parts, count, i, result) {
  gsub(/\\\|/, "|", text)
  while (match(text, /\[[^]]*\]\([^)]*\)/)) {
    link = substr(text, RSTART, RLENGTH)
    sub(/^\[/, "", link)
    sub(/\].*/, "", link)
    text = substr(text, 1, RSTART - 1) link substr(text, RSTART + RLENGTH)
  }
  count = split(text, parts, "`")
  result = ""
  for (i = 1; i <= count; i++)
    result = result (i % 2 ? plain(parts[i]) : "\\fB" plain(parts[i]) "\\fR")
  # A line that begins so would be a request.
  if (result ~ /^[.']/) result = "\\&" result
  return result
}

function row(line,    at) {
  sub(/^\| */, "", line)
  sub(/ *\|$/, "", line)
  at = index(line, " | ")
  print ".TP"
  print styled(substr(line, 1, at - 1))
  print styled(substr(line, at + 3))
}

BEGIN {
  print ".TH XQUERY 1 \"\" \"xquery " version "\" \"User Commands\""
  print ".SH NAME\nxquery \\- evaluate XQuery over XML and HTML"
  print ".SH SYNOPSIS"
  isFirstBlock = 1
}

/^```/ {
  isCode = !isCode
  print isCode ? (isFirstBlock ? "" : ".PP\n") ".nf" : ".fi"
  isNew = 0
  if (!isCode && isFirstBlock) {
    print ".SH DESCRIPTION"
    isFirstBlock = 0
  }
  next
}
isCode { print plain($0); next }

/^# / { next }
/^## / { print ".SH " toupper(substr($0, 4)); next }
/^### / { print ".SS " substr($0, 5); next }

# The first two lines of a table are its heading.
/^\|/ {
  if (++rows > 2) row($0)
  next
}
{ rows = 0 }

/^$/ { isNew = 1; next }
{
  if (isNew) print ".PP"
  isNew = 0
  print styled($0)
}
