#!/bin/sh
# hpl_test.sh folder: HPL with two ranks, and the kernels that come with it: systems of equations of several orders and
# block sizes, on both grids, over the variants of the factorisation.
. "$(dirname "$0")/common.sh"
need /usr/bin/hpcc /usr/bin/mpirun
cat > hpccinf.txt << END
HPL input

HPL.out      output file name (if any)
8            device out (6=stdout,7=stderr,file)
3            # of problems sizes (N)
97 300 600   Ns
2            # of NBs
32 80        NBs
0            PMAP process mapping (0=Row-,1=Column-major)
2            # of process grids (P x Q)
1 2          Ps
2 1          Qs
16.0         threshold
3            # of panel fact
0 1 2        PFACTs (0=left, 1=Crout, 2=Right)
1            # of recursive stopping criterium
4            NBMINs (>= 1)
1            # of panels in recursion
2            NDIVs
3            # of recursive panel fact.
0 1 2        RFACTs (0=left, 1=Crout, 2=Right)
1            # of broadcast
1            BCASTs (0=1rg,1=1rM,2=2rg,3=2rM,4=Lng,5=LnM)
1            # of lookahead depth
1            DEPTHs (>=0)
2            SWAP (0=bin-exch,1=long,2=mix)
64           swapping threshold
0            L1 in (0=transposed,1=no-transposed) form
0            U  in (0=transposed,1=no-transposed) form
1            Equilibration (0=no,1=yes)
8            memory alignment in double (> 0)
##### This line (no. 32) is ignored (it serves as a separator). ######
0            Number of additional problem sizes for PTRANS
1200         values of N
0            number of additional blocking sizes for PTRANS
40           values of NB
END

for side in ours reference; do
  rm -f hpccoutf.txt
  mpi_run $side hpcc
  if [ "$status" != 0 ] || ! grep -q '^Success=1' hpccoutf.txt; then
    cat printed hpccoutf.txt && exit 1
  fi
  grep -E '^\|\|.*FAILED' hpccoutf.txt > "$side".failed || true
  grep -cE '(\.\. |\) *)(PASSED|FAILED)' hpccoutf.txt > "$side".count
  sed -n 's/^HPL_Tflops=/HPL, Tflop\/s: /p' hpccoutf.txt
done
verdict "HPL"
