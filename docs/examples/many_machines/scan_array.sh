#!/bin/sh
# SPDX-License-Identifier: MIT
# One part of a scan for each task of a job array; written for Slurm:
#
#     sbatch --wait --array=1-4 scan_array.sh RESULTS [ARGUMENT...]
#     vsttorture-scan report RESULTS/part-*.jsonl
#
# RESULTS is a folder that all nodes share; the events of task K go to part-K.jsonl there. ARGUMENT...: options and
# folders for vsttorture-scan. Every node has vsttorture-scan in its path, and the same plug-ins at the same paths.
#
# Where the homes of the nodes are on a network file system, add --cache off: SQLite's locks do not work there.
#
# A plug-in that fails is a result and no failure of the task: the array counts as failed only when a part of the scan
# is missing. Other batch systems differ in the three variables.
#SBATCH --job-name=vsttorture-scan
#SBATCH --output=vsttorture-scan-%A_%a.log
#SBATCH --cpus-per-task=2
set -u
part=$SLURM_ARRAY_TASK_ID
parts=$SLURM_ARRAY_TASK_COUNT
processors=${SLURM_CPUS_PER_TASK:-1}

results=$1
shift
mkdir -p "$results"
vsttorture-scan --quiet --no-progress --jobs "$processors" --shard "$part/$parts" \
  --json "$results/part-$part.jsonl" "$@"
[ $? -le 1 ]
