// Closes a list of tables of rows.
#undef ENTRY
#undef KERNEL
#undef DOC
