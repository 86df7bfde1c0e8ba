#!/bin/sh
# packages_test.sh script: what tools/packages.sh does on machines that have, lack, or cannot install packages, with
# stand-ins for the system's programs.
set -eu

script=$1
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
failures=0

# stand_in name: a program of that name, from what comes in, ahead of the system's.
stand_in() {
  cat > "$folder/$1"
  chmod +x "$folder/$1"
}
stand_in dpkg-query <<END
#!/bin/sh
for last; do :; done
grep -qx "\$last" "$folder/absent" || printf installed
END
stand_in apt-get <<END
#!/bin/sh
words=apt-get
while [ \$# -gt 0 ]; do
  case \$1 in
    -o) shift ;;
    -*) ;;
    *) words="\$words \$1" ;;
  esac
  shift
done
echo "\$words" >> "$folder/log"
END
stand_in sudo <<END
#!/bin/sh
printf 'sudo ' >> "$folder/log"
exec "\$@"
END

# expect case status log user absent purpose...: run by this user (0 is root) on a machine that lacks these packages,
# the script returns this status, and these commands have been run.
expect() {
  name=$1 status=$2 log=$3
  printf '#!/bin/sh\necho %s\n' "$4" | stand_in id
  printf '%s\n' "$5" | tr ' ' '\n' > "$folder/absent"
  shift 5
  : > "$folder/log"
  if output=$(PATH=$folder:$PATH "$script" "$@" 2>&1); then got=0; else got=$?; fi
  if [ $got -eq "$status" ] && [ "$(paste -sd, "$folder/log")" = "$log" ]; then
    echo "$name: ok"
  else
    echo "$name: status $got, ran \"$(paste -sd, "$folder/log")\", printed: $output"
    failures=$((failures + 1))
  fi
}

expect "nothing missing" 0 "" 0 "" build test demo ecosystem packages bench lint sanitizers fuzz coverage
expect "missing for another purpose" 0 "" 0 gcovr build test
expect "one missing" 0 "apt-get update,apt-get install ninja-build" 0 ninja-build build test
expect "missing twice" 0 "apt-get update,apt-get install clang libomp-dev" 0 "libomp-dev clang" fuzz sanitizers
expect "not root" 0 "sudo apt-get update,sudo apt-get install gfortran" 1000 gfortran test
expect "no such purpose" 2 "" 0 "" build everything

[ $failures -eq 0 ]
