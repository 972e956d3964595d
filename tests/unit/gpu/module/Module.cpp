// Has nothing: only its file counts.
