"""The parts of run_mutants."""
