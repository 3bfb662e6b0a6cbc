// A POSIX plug-in has no system headers that the library could trim.
bool SystemHeadersWhole() {
    return true;
}
