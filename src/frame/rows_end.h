// Closes a list of tables of rows.
#undef ENTRY
#undef KERNEL
#undef HELPER
#undef DOC
