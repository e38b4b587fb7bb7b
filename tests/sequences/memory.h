// What a program's memory holds first. It stands alone: programs that are written out as sources have it, too.
#ifndef KASTARRI_TESTS_SEQUENCES_MEMORY_H
#define KASTARRI_TESTS_SEQUENCES_MEMORY_H

inline void fill(unsigned char* memory, unsigned size, unsigned long long key) {
  for (unsigned i = 0; i < size; ++i) {
    key = key * 6364136223846793005u + 1442695040888963407u;
    memory[i] = static_cast<unsigned char>(key >> 56);
  }
}

#endif
