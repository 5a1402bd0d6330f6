// Keeps the static library non-empty until the module sources land.
