#!/bin/sh
# common.sh: what the scripts of this folder share. They read it, called with the folder of the companions.
#
# Each script runs programs that no one here wrote twice: with libblas.so.3 of the companions ("ours"), and with the
# reference BLAS of the distribution. It fails where something fails with ours and not with the reference, and where a
# program loaded another BLAS than the one meant. LAPACK is the reference one on both sides: the LAPACK of another BLAS
# calls that one's routines. Programs are found as packages install them; a script whose packages lack is skipped.
set -eu

companions=$1
scripts=$(cd "$(dirname "$0")" && pwd)
libraries=/usr/lib/x86_64-linux-gnu
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
for side in ours reference; do
  mkdir "$work/$side"
  ln -s $libraries/lapack/liblapack.so.3 "$work/$side"
done
ln -s "$companions/libblas.so.3" "$work/ours"
ln -s $libraries/blas/libblas.so.3 "$work/reference"
cd "$work"
# Two threads, so that drivers of threads run; they wait asleep, for suites make a great many small calls, and a thread
# that waits in a loop takes the time of whatever else a machine runs.
OMP_NUM_THREADS=${OMP_NUM_THREADS:-2}
OMP_WAIT_POLICY=${OMP_WAIT_POLICY:-passive}
export OMP_NUM_THREADS OMP_WAIT_POLICY

# need file...: skips the script where one is not here.
need() {
  for file; do
    [ -e "$file" ] || { echo "$file is not here" && exit 77; }
  done
}
need $libraries/lapack/liblapack.so.3 $libraries/blas/libblas.so.3

# run side command...: what it prints goes to the file "printed", its exit status to $status. Every BLAS or LAPACK that
# one of its processes loads is that of the side, and one of them does load its BLAS.
run() {
  folder=$work/$1
  shift
  rm -f loads.*
  status=0
  LD_LIBRARY_PATH=$folder LD_DEBUG=libs LD_DEBUG_OUTPUT=$work/loads "$@" > printed 2>&1 || status=$?
  export status
  sed -n 's/.*calling init: //p' loads.* | sort -u > libraries
  grep -E '/lib(blas|lapack|openblas|blis|atlas)[^/]*$' libraries > loaded || true
  if ! grep -qxF "$folder/libblas.so.3" loaded || grep -vF "$folder/" loaded; then
    echo "$* did not run with the BLAS of $folder alone:" && cat loaded printed && exit 1
  fi
}

# tally side: what a program of ours printed in the last run, a line "failed NAME" for each failure and one "count N".
tally() {
  if [ "$status" != 0 ] || ! grep -q '^count ' printed; then
    cat printed && exit 1
  fi
  sed -n 's/^failed //p' printed > "$1".failed
  sed -n 's/^count //p' printed > "$1".count
}

# repeat n text: n lines, so that a list of failures grows with their number.
repeat() {
  awk -v n="$1" -v text="$2" 'BEGIN { for (i = 1; i <= n; ++i) printf "%s, failure %d\n", text, i }'
}

# mpi_run side command...: the same with two ranks of Open MPI, between which QTB is told to share the cores. A number
# of threads that is given goes before that, so there is none.
mpi_run() {
  side=$1
  shift
  unset OMP_NUM_THREADS
  run "$side" env OMPI_ALLOW_RUN_AS_ROOT=1 OMPI_ALLOW_RUN_AS_ROOT_CONFIRM=1 Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE=2 \
    Q_MPI_THREAD_LEVEL=1 mpirun --oversubscribe --bind-to none -np 2 "$@"
}

# verdict what: compares the lists of failures of both sides, ours.failed and reference.failed, one a line; the numbers
# of tests are in ours.count and reference.count. Failures of ours alone have to stand in explained.list.
verdict() {
  sort -u -o ours.failed ours.failed
  sort -u -o reference.failed reference.failed
  comm -12 ours.failed reference.failed | sed 's/^/fails with the reference BLAS too: /'
  comm -13 ours.failed reference.failed | sed 's/^/fails with the reference BLAS only: /'
  comm -23 ours.failed reference.failed > own
  grep -vE '^(#|$)' "$scripts/explained.list" > explanations
  grep -xEf explanations own > explained || true
  grep -vxEf explanations own > unexplained || true
  sed 's/^/explained: /' explained
  sed 's/^/fails with QTB only: /' unexplained
  echo "$1: $(cat ours.count) tests, $(wc -l < ours.failed) failures, $(wc -l < explained) of them explained;" \
    "with the reference BLAS $(cat reference.count) and $(wc -l < reference.failed)"
  [ ! -s unexplained ]
  # A failure may end the tests behind it.
  [ -s explained ] || [ "$(cat ours.count)" -ge "$(cat reference.count)" ]
}
