/* A library of libwbclient's name that has none of its calls. */

__attribute__((visibility("default"))) int UselessWbclient = 0;
