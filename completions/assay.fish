# Completion of assay for fish.

complete -c assay -f
complete -c assay -a -help -d "Show the options"
complete -c assay -a -crashAfter= -d "Crash after this many steps"
complete -c assay -a -throwAfter= -d "Fail after this many steps"
complete -c assay -a -app= -d "Name of the host application"
complete -c assay -a -stdout= -d "Print a line on standard output"
complete -c assay -a -stderr= -d "Print a line on standard error"
complete -c assay -a -exit= -d "Exit with this status"
complete -c assay -a -verbose= -d "Verbosity of the log"
complete -c assay -a -timeout= -d "Accepted and ignored"
complete -c assay -a -comment= -d "Print a comment line"
complete -c assay -a -hang= -d "Accepted and ignored"
