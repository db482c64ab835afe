// Deletes the file named by its only argument, retrying while another
// process still holds it.  Started by the tool without waiting.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::fprintf(stderr, "usage: main_delete_file FILE\n");
    return 2;
  }
  constexpr int kAttempts = 30;
  for (int attempt = 1; attempt <= kAttempts; ++attempt) {
    chmod(argv[1], S_IRWXU);
    if (std::remove(argv[1]) == 0) return 0;
    usleep(100000u * static_cast<unsigned>(attempt));
  }
  return 1;
}
