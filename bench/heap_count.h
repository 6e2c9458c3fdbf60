// How often the program has asked the heap for a block: operator new, malloc and calloc together. Not for
// a program under a sanitizer, which has a heap of its own.
#pragma once

long BlocksTaken();
