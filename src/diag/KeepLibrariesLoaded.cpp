// Sanitizer builds only: shared libraries are never unloaded. The leak check runs at exit,
// after SDL and the GL driver have unloaded what they loaded at run time; what those
// libraries still held then looks leaked, with no name a suppression could match. Kept
// loaded, their data still points at it, and the check reports only real leaks. The build
// links this definition into every program (see OX_SANITIZE in CMakeLists.txt).
#ifdef OX_SANITIZE
extern "C" int dlclose(void*)
{
    return 0;
}
#endif
