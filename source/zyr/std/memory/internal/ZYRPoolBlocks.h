// The block records of the pools and sub-allocators: boundary tags, free-tree nodes, pool
// headers and slots. Only the library reads or writes them.
#pragma once

#include <cstring>

#include "zyr/std/memory/ZYRPool.h"
#include "zyr/std/memory/internal/redblack_tree.h"

// The boundary tag in front of every block of a VariableSizeAllocator page.
struct BlkHeader {
    // Size of the previous block in the page (0 for the first); bit 0 set while this block
    // is free.
    unsigned int prevSize;
    // Bytes of this block's user area.
    unsigned int size;
};

// Built in place at a free block's user pointer; its key is the size word just in front of
// it. The free blocks of one size form a list: its head is a node of the free tree (or, for
// small sizes, sits in a bin), and the others hang after it. A list member is not in the
// tree, so it keeps its list predecessor in the left link and says so with the owner flag.
class FreeBlock : public ZYRStd::redblack_node<unsigned int, FreeBlock, ZYRStd::ZYRRBParent> {
public:
    unsigned int key() const {
        unsigned int size;
        std::memcpy(&size, reinterpret_cast<const unsigned char*>(this) - 4, sizeof size);
        return size;
    }
    bool inSizeList() const { return ownerFlag(); }
    FreeBlock* nextSameSize() const { return next_; }
    void setNextSameSize(FreeBlock* next) { next_ = next; }
    FreeBlock* prevSameSize() const { return left(); }
    void setPrevSameSize(FreeBlock* prev) { setLeft(prev); }

private:
    FreeBlock* next_ = nullptr;
};

// One slot of a FixedSizeAllocator pool; while free it links the pool's free list.
struct DMMPoolBlock {
    DMMPoolBlock* next;
};

// The header at the start of every FixedSizeAllocator pool; the slots follow it.
struct DMMPoolControl {
    DMMPoolControl* nextPool;
    DMMPoolBlock* freeList;
    unsigned char* end; // one past the pool
    unsigned int freeSlots;
    unsigned int slots;
    unsigned int stride; // bytes from one slot to the next
    unsigned int poolBytes;
};

namespace ZYRStd {

struct ZYRStdAllocatorFixedSizePoolPage {
    ZYRStdAllocatorFixedSizePoolPage* next;
    unsigned int freeElements;
    unsigned int elements;
};

} // namespace ZYRStd
