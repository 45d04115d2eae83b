// Stands for the headers that are precompiled for all tests.
