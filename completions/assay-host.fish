# Completion of assay-host for fish.

set -l commands run torture diff
set -l none "not __fish_seen_subcommand_from $commands"
set -l run "__fish_seen_subcommand_from run"
set -l torture "__fish_seen_subcommand_from torture"
set -l child "__fish_seen_subcommand_from run torture"
set -l diff "__fish_seen_subcommand_from diff"

complete -c assay-host -f
complete -c assay-host -s h -l help -d "Show the options"
complete -c assay-host -n $none -l version -d "Show the version"
complete -c assay-host -n $none -a run -d "Run assay and show its report"
complete -c assay-host -n $none -a torture -d "Make assay fail at every step and check each outcome"
complete -c assay-host -n $none -a diff -d "Show the differences between two reports"

complete -c assay-host -n $child -l assay -r -F -d "Program to run"
complete -c assay-host -n $child -l timeout -x -d "Kill the child after these seconds, 0: never"
complete -c assay-host -n $run -l format -x -a "text json jsonl" -d "Form of the output"
complete -c assay-host -n $run -l schema -x -a "1 2" -d "Version of json and jsonl"
complete -c assay-host -n $run -l need -x -a "opengl opencl both" -d "Exit by whether they work"
complete -c assay-host -n $run -l identify -d "Name this machine in json and jsonl"
complete -c assay-host -n $run -l raw -d "Print the child's own lines first"
complete -c assay-host -n $run -l output -r -F -d "Write to this file"
complete -c assay-host -n $torture -l kind -x -a "crash throw both" -d "Kind of failure"
complete -c assay-host -n $diff -F
complete -c assay-host -n $diff -l tolerance -x -d "Of measurements, relative to the larger one"
