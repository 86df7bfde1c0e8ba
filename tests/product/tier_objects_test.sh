#!/bin/sh
# tier_objects_test.sh tier file tier...: reads every object of a tier, whose paths file lists, and fails on what would
# let one tier's code reach a processor of another. Behind the file stand all tiers, lowest first.
#
#   weak or unique symbols   the linker keeps one of several copies, perhaps that of a higher tier
#   static initialisers      run at load on every processor
#   instructions             only those of mnemonics/<tier>.txt, which has what a tier adds, up to the tier; the wider
#                            encoding (VEX, EVEX) only from the first tier on that lists any of it, in the objects that
#                            mnemonics/vex_objects.txt names, each of which has it
#   defined global symbols   only qtb_blas_<tier>_x<name>, the inner kernels of GEMM and GEMV, the diagonal kernels of
#                            TRSV and TRMV and the general forms of the complex band triangles, and a higher tier's name
#                            for the same procedure
#   undefined symbols        only the library's own, of no other tier, and the memory routines that a compiler calls
set -eu

tier=$1
objects=$2
shift 2
lists=$(dirname "$0")/mnemonics


# One word per line, without comments.
words() {
  sed 's/#.*//' "$@" | tr -s ' \t' '\n' | sed '/^$/d'
}

expected=$(grep -c . "$objects")
known=
for lower in "$@"; do
  if [ ! -f "$lists/$lower.txt" ]; then
    echo "tier_objects_test: the tier $lower has no list of instructions: write what it adds to the tiers below it" \
      "into tests/product/mnemonics/$lower.txt" >&2
    exit 2
  fi
  known="$known $(words "$lists/$lower.txt" | tr '\n' ' ')"
  [ "$lower" != "$tier" ] || break
done
if [ "$lower" != "$tier" ]; then
  echo "tier_objects_test: $tier is not among the tiers $*" >&2
  exit 2
fi
wide=$(echo "$known" | tr ' ' '\n' | grep '^v' | tr '\n' ' ' || true)
allowed=$(echo "$known" | tr ' ' '\n' | grep -v '^v' | tr '\n' ' ')
vex_objects=
[ -z "$wide" ] || vex_objects=$(words "$lists/vex_objects.txt" | tr '\n' ' ')

# awk's exit status is the pipeline's; an object that the disassembler cannot read shows as a missing one.
xargs "${OBJDUMP:-objdump}" -h -t -d -w -M intel --no-show-raw-insn < "$objects" | awk \
  -v tier="$tier" -v allowed="$allowed" -v wide="$wide" -v vex_objects="$vex_objects" \
  -v expected="$expected" -v tiers="$*" '
  function reject(what) {
    print object ": " what
    rejected++
  }
  function set_of(text, set,   parts, count, i) {
    count = split(text, parts, " ")
    for (i = 1; i <= count; i++) set[parts[i]] = 1
  }
  # The rank of the tier in the name of a procedure, 0 without one.
  function rank_of(name,   word) {
    split(name, word, "_")
    sub(/^qtb_blas_[a-z0-9]+_/, "", name)
    if (name ~ /^(x|[sdcz]gemm_([a-z0-9]+_)?kernel)/) return rank[word[3]]
    if (name ~ /^([dcz]gemv_[ntc](_even|_odd)?|[sdcz]trsv_diag_[ul][ntc][nu]|[sdcz]trmv_diag)$/) return rank[word[3]]
    return name ~ /^[cz]tb[ms]v_general$/ ? rank[word[3]] : 0
  }
  # At the end of an object: a name of a higher tier stands for a procedure that has a name of this one, and what may be
  # wide is.
  function settle(   name) {
    for (name in borrowed)
      if (!(borrowed[name] in procedures)) reject("global symbol " name)
    if (objects && source in may_be_wide && !wider) reject("no instruction of the wider encoding")
    wider = 0
    split("", borrowed)
    split("", procedures)
  }
  BEGIN {
    split(tiers, order, " ")
    for (i in order) rank[order[i]] = i
    set_of(allowed, is_allowed)
    set_of(wide, is_wide)
    set_of(vex_objects, may_be_wide)
    set_of("memcpy memmove memset memcmp _GLOBAL_OFFSET_TABLE_", is_runtime)
    set_of("lock rep repz repnz data16 addr32 cs ds es ss notrack bnd", is_prefix)
  }

  / file format elf64-x86-64$/ {
    settle()
    object = $1
    sub(/:$/, "", object)
    source = object
    sub(/.*\//, "", source)
    sub(/\.o$/, "", source)
    objects++
    part = ""
    next
  }
  /^Sections:$/ { part = "sections"; next }
  /^SYMBOL TABLE:$/ { part = "symbols"; next }
  /^Disassembly of section / { part = "code"; function_name = ""; next }

  part == "sections" && $2 ~ /^\.(preinit_array|init_array|fini_array|ctors|dtors)/ {
    reject("static initialiser in section " $2)
  }

  # An address, a space, seven characters of flags, then section, tab, size, perhaps the visibility, and the name.
  part == "symbols" && /^[0-9a-f]+ / {
    symbols++
    flags = substr($0, 18, 7)
    section = substr($0, 26)
    sub(/\t.*/, "", section)
    name = $NF
    if (flags ~ /w/) reject("weak symbol " name)
    else if (flags ~ /u/) reject("unique symbol " name)
    else if (section == "*COM*") reject("common symbol " name)
    else if (section == "*UND*") {
      if (rank_of(name) && rank_of(name) != rank[tier]) reject("reference to another tier: " name)
      else if (name !~ /^qtb_/ && !(name in is_runtime)) reject("undefined symbol " name)
    } else if (flags ~ /g/) {
      place = section " " substr($0, 1, 16)
      if (rank_of(name) == rank[tier]) procedures[place] = 1
      else if (rank_of(name) > rank[tier]) borrowed[name] = place
      else reject("global symbol " name)
    }
  }

  part == "code" && /^[0-9a-f]+ <.*>:$/ {
    function_name = $2
    gsub(/[<>:]/, "", function_name)
  }
  part == "code" && /^ *[0-9a-f]+:\t/ {
    instructions++
    text = $0
    sub(/^ *[0-9a-f]+:\t/, "", text)
    count = split(text, token, " ")
    i = 1
    while (i < count && (token[i] in is_prefix || token[i] ~ /^rex/)) i++
    mnemonic = token[i]
    operands = text
    sub(/[ \t]*[#<].*/, "", operands)
    if (mnemonic in is_allowed && operands ~ /[yz]mm[0-9]/) reject("wide register in " function_name ": " text)
    else if (mnemonic in is_allowed && operands ~ /(^|[ ,])mm[0-7]/) reject("MMX register in " function_name ": " text)
    else if (mnemonic in is_allowed) ;
    else if (mnemonic ~ /^(v|\{)/) {
      wider++
      if (!(source in may_be_wide)) reject("wider encoding in " function_name ": " text)
      else if (!(mnemonic in is_wide) || operands ~ /zmm|[xy]mm(1[6-9]|2[0-9]|3[01])|\{/)
        reject("above the tier in " function_name ": " text)
    } else
      reject("not in the lists of " tier ", in " function_name ": " text)
  }

  END {
    settle()
    if (objects != expected) {
      print tier ": read " objects + 0 " objects of " expected
      rejected++
    }
    if (instructions == 0 || symbols == 0) {
      print tier ": nothing to read"
      rejected++
    }
    printf "%s: %d objects, %d symbols, %d instructions, %d rejected\n", tier, objects, symbols, instructions, rejected
    exit rejected > 0
  }'
