// A shared object of something else.
extern "C" int appsyncSomethingElse();

int appsyncSomethingElse() {
  return 0;
}
