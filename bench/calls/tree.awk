# The tree of calls, and its counts. Reads the functions' names first (offset, tab, name, tab,
# file:line), then the calls (depth, offset); `root` is the folder of the library's sources.

# A name without arguments, template arguments and result: "bool (anonymous namespace)::lend<char>
# (int)" becomes lend.
function short(name, old) {
  sub(/( \[clone |\.localalias).*/, "", name)
  gsub(/\(anonymous namespace\)::/, "", name)
  gsub(/operator\(\)/, "operator{call}", name)
  gsub(/operator->/, "operator{arrow}", name)
  do { old = name; gsub(/\([^()]*\)( const)?/, "", name) } while (name != old)
  do { old = name; gsub(/<[^<>]*>/, "", name) } while (name != old)
  if (name !~ /operator /) sub(/^.* /, "", name)
  gsub(/{call}/, "()", name)
  gsub(/{arrow}/, "->", name)
  return name
}

function moduleOf(file) {
  sub(/.*\//, "", file)
  sub(/\.[^.]*$/, "", file)
  return file
}

# file:line from `root` on, without ".."; "" for what stands elsewhere.
function placeOf(path) {
  sub(/ \(discriminator.*/, "", path)
  while (sub(/[^\/]+\/\.\.\//, "", path)) continue
  return index(path, root) == 1 ? substr(path, length(root) + 1) : ""
}

# Counts each thing of a kind once.
function note(kind, thing) {
  if (!((kind, thing) in seen)) count[kind]++
  seen[kind, thing]
}

# A step from one module into another; `kind` is how callers are told.
function noteSwitch(kind, from, to) {
  if (from == "" || from == to) return
  count[kind " switches"]++
  note(kind " pairs", from " " to)
}

FNR == NR {
  split($0, field, "\t")
  place[field[1]] = placeOf(field[3])
  name[field[1]] = short(field[2])
  next
}

/^library / || place[$2] == "" { next }

{
  while (top > 0 && depth[top] >= $1) top--
  file = place[$2]
  sub(/:.*/, "", file)
  module = moduleOf(file)
  isSource = file ~ /\.cpp$/
  printf "%*s%s  %s\n", 2 * top, "", name[$2], place[$2]
  count["calls"]++
  note("functions", place[$2] " " name[$2])
  note("files", file)
  note("modules", module)
  noteSwitch("all", top ? moduleAt[top] : "", module)
  if (isSource) {
    count["source calls"]++
    note("source files", file)
    noteSwitch("source", top ? sourceAt[top] : "", module)
    if (lastSource != "" && lastSource != module) count["changes"]++
    lastSource = module
  }
  sourceAt[top + 1] = isSource ? module : top ? sourceAt[top] : ""
  moduleAt[++top] = module
  depth[top] = $1
}

END {
  printf "headers as their callers: %d calls, %d files, %d switches between %d ordered pairs of " \
    "modules; from line to line another one: %d\n", count["source calls"], count["source files"],
    count["source switches"], count["source pairs"], count["changes"]
  printf "%d calls, %d functions, %d files, %d modules, %d switches between %d ordered pairs of " \
    "modules\n", count["calls"], count["functions"], count["files"], count["modules"],
    count["all switches"], count["all pairs"]
}
