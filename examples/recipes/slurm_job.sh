#!/bin/bash
#SBATCH --job-name=compare-results
#SBATCH --nodes=2
#SBATCH --ntasks-per-node=4
#SBATCH --cpus-per-task=2
#SBATCH --time=01:00:00
# Compares the results of two runs, in folders that all nodes see, and writes a report.
#
#   sbatch slurm_job.sh FIRST SECOND REPORT
first=$1 second=$2 report=$3
digits=${DIGITS:-10}

# The ranks end together. If one was killed, srun ends the others a minute later. With
# --kill-on-bad-exit it would also end those that take a little longer than the first to exit with
# the status 1, and 143 would be the status. Without srun, mpirun -q is enough.
status=0
srun --kill-on-bad-exit=0 --wait=60 --cpus-per-task="${SLURM_CPUS_PER_TASK:-1}" \
    talcmp-mpi --tol "$digits" --report "$first" "$second" >"$report" || status=$?
case $status in
0) echo "all results are the same" ;;
1) echo "some results differ, as $report says" ;;
2) echo "some results could not be compared" >&2 ;;
*)
    echo "the comparison was ended: there is no answer" >&2
    status=2
    ;;
esac
exit "$status"
