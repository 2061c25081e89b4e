#include "PropertyPool.h"

#include <cstdlib>
#include <mutex>
#include <new>
#include <vector>

#include "HostMemory.h"

#if defined(__SANITIZE_ADDRESS__)
#define NITF_POOL_DISABLED 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define NITF_POOL_DISABLED 1
#endif
#endif

#ifndef NITF_POOL_DISABLED

namespace {

// Block sizes, the first for property objects. Text blocks keep their size class in the byte before the
// text; a text larger than the largest class comes from the heap, marked kHeap.
const size_t kSizes[] = {32, 16, 32, 64, 128};
const int kClasses = 5;
const unsigned char kHeap = 0xFF;
const size_t kChunkSize = 64 * 1024;

struct FreeBlock {
    FreeBlock* next;
};

// Chunks are never returned: blocks freed on any thread go to that thread's lists.
std::mutex g_chunkGuard;
std::vector<void*>* g_chunks = nullptr;

// The library is linked, not loaded on demand: its thread-local lists can take the fast access model.
__attribute__((tls_model("initial-exec"))) thread_local FreeBlock* t_free[kClasses] = {};

void refill(int sizeClass) {
    char* chunk = static_cast<char*>(HMalloc(kChunkSize));
    {
        std::lock_guard<std::mutex> lock(g_chunkGuard);
        if (!g_chunks)
            g_chunks = new std::vector<void*>;
        g_chunks->push_back(chunk);
    }
    const size_t size = kSizes[sizeClass];
    for (size_t at = 0; at + size <= kChunkSize; at += size) {
        FreeBlock* block = reinterpret_cast<FreeBlock*>(chunk + at);
        block->next = t_free[sizeClass];
        t_free[sizeClass] = block;
    }
}

void* take(int sizeClass) {
    if (!t_free[sizeClass])
        refill(sizeClass);
    FreeBlock* block = t_free[sizeClass];
    t_free[sizeClass] = block->next;
    return block;
}

void give(int sizeClass, void* block) {
    FreeBlock* freed = static_cast<FreeBlock*>(block);
    freed->next = t_free[sizeClass];
    t_free[sizeClass] = freed;
}

} // namespace

#endif

#ifdef NITF_POOL_DISABLED

void* CPropertyPool::allocateObject(size_t size) {
    return HMalloc(size);
}
void CPropertyPool::releaseObject(void* object) {
    std::free(object);
}
char* CPropertyPool::allocateText(size_t size) {
    return static_cast<char*>(HMalloc(size));
}
void CPropertyPool::releaseText(char* text) {
    std::free(text);
}

#else

void* CPropertyPool::allocateObject(size_t size) {
    if (size > kSizes[0])
        return HMalloc(size);
    return take(0);
}

void CPropertyPool::releaseObject(void* object) {
    if (object)
        give(0, object);
}

char* CPropertyPool::allocateText(size_t size) {
    for (int sizeClass = 1; sizeClass < kClasses; ++sizeClass) {
        if (size + 1 <= kSizes[sizeClass]) {
            unsigned char* block = static_cast<unsigned char*>(take(sizeClass));
            block[0] = static_cast<unsigned char>(sizeClass);
            return reinterpret_cast<char*>(block + 1);
        }
    }
    unsigned char* block = static_cast<unsigned char*>(HMalloc(size + 1));
    block[0] = kHeap;
    return reinterpret_cast<char*>(block + 1);
}

void CPropertyPool::releaseText(char* text) {
    if (!text)
        return;
    unsigned char* block = reinterpret_cast<unsigned char*>(text) - 1;
    if (block[0] == kHeap)
        std::free(block);
    else
        give(block[0], block);
}

#endif
