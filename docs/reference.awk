# Makes the plain comments of a header such that doxygen shows them as they are laid out:
#
#   // text              before a declaration: its description
#   //   text            drawn in by two blanks or more: a table or an example, shown as it stands
#   declaration;  // text
#
# What would be a mark-up of doxygen's own in running text is kept from it. Lines keep their numbers.

# Only what stands between two marks is shown as code, as it is.
function plain(text, parts, count, i, result) {
  count = split(text, parts, "`")
  for (i = 1; i <= count; ++i) {
    if (count % 2 && i % 2 == 0) {
      result = result "`" parts[i] "`"
      continue
    }
    gsub(/[\\@<>#%&$*~|]/, "\\\\&", parts[i])
    result = result parts[i] (count % 2 || i == count ? "" : "\\`")
  }
  return result
}

# A line is written when the next one is known: the last of a comment closes it.
function put(line) {
  if (held) print last
  last = line
  held = 1
}

function end_comment() {
  if (verbatim) last = last " @endverbatim"
  if (comment) last = last " */"
  verbatim = comment = 0
}

/^ *\/\/( |$)/ {
  sub(/^ *\/\/ ?/, "")
  is_table = /^  / || (verbatim && /^$/)
  if (verbatim && !is_table) last = last " @endverbatim"
  text = is_table ? $0 : plain($0)
  if (is_table && !verbatim) {
    if (comment) last = last " @verbatim"
    else text = "@verbatim " text
  }
  put(comment ? text : "/** " text)
  verbatim = is_table
  comment = 1
  next
}

{ end_comment() }

match($0, /  +\/\/ /) {
  put(substr($0, 1, RSTART) " /**< " plain(substr($0, RSTART + RLENGTH)) " */")
  next
}

{ put($0) }

END {
  end_comment()
  put("")
}
