// An intrusive red-black tree with unique keys: nodes live wherever their owner put them.
#pragma once

#include <cstdint>

namespace ZYRStd {

// The parent link of a tree node. Nodes are at least 4-byte aligned, so the two low bits
// carry the colour and one flag that the node's owner may use for its own purposes.
class ZYRRBParent {
public:
    enum eColour : unsigned { kRed = 0, kBlack = 1 };

    eColour colour() const { return (bits_ & kColourBit) ? kBlack : kRed; }
    bool isRed() const { return (bits_ & kColourBit) == 0; }
    void setColour(eColour colour) { bits_ = (bits_ & ~kColourBit) | colour; }

    bool ownerFlag() const { return (bits_ & kOwnerBit) != 0; }
    void setOwnerFlag(bool on) { bits_ = on ? (bits_ | kOwnerBit) : (bits_ & ~kOwnerBit); }

protected:
    static constexpr uintptr_t kColourBit = 1;
    static constexpr uintptr_t kOwnerBit = 2;
    static constexpr uintptr_t kLinkMask = ~uintptr_t{3};

    uintptr_t bits_ = 0;
};

// Links of a node of type Node (which derives from this) with keys of type Key. Node
// supplies `Key key() const`; keys of the nodes in one tree are distinct.
template <class Key, class Node, class Parent = ZYRRBParent> class redblack_node : public Parent {
public:
    Node* left() const { return child_[0]; }
    Node* right() const { return child_[1]; }
    // child(false) is the left child, child(true) the right one.
    Node* child(bool right) const { return child_[right]; }
    Node* parent() const { return reinterpret_cast<Node*>(this->bits_ & Parent::kLinkMask); }
    void setLeft(Node* n) { child_[0] = n; }
    void setRight(Node* n) { child_[1] = n; }
    void setParent(Node* n) {
        this->bits_ = reinterpret_cast<uintptr_t>(n) | (this->bits_ & ~Parent::kLinkMask);
    }

private:
    Node* child_[2] = {nullptr, nullptr};
};

// Where a search ended: the node with the key, or the empty place where it belongs.
template <class Node> struct tree_search_state {
    Node* found = nullptr;
    Node* parent = nullptr;
    bool asLeftChild = false;
};

// In-order (ascending keys) walk.
template <class Node> class redblack_tree_iterator {
public:
    explicit redblack_tree_iterator(Node* node = nullptr) : node_(node) {}
    Node& operator*() const { return *node_; }
    Node* operator->() const { return node_; }
    Node* get() const { return node_; }
    redblack_tree_iterator& operator++() {
        if (node_->right()) {
            node_ = node_->right();
            while (node_->left())
                node_ = node_->left();
            return *this;
        }
        Node* up = node_->parent();
        while (up && node_ == up->right()) {
            node_ = up;
            up = up->parent();
        }
        node_ = up;
        return *this;
    }
    bool operator==(const redblack_tree_iterator& other) const { return node_ == other.node_; }

private:
    Node* node_;
};

// The tree never allocates on its own and its destructor leaves the nodes alone: linked
// nodes ("references") belong to the caller. The owning calls (InsertNode,
// InsertCopyOfNode, DeleteNode, RemoveNode, DeleteAllNodes) are for nodes made with new.
template <class Node, class Key> class redblack_tree {
public:
    using iterator = redblack_tree_iterator<Node>;

    redblack_tree() = default;
    redblack_tree(const redblack_tree&) = delete;
    redblack_tree& operator=(const redblack_tree&) = delete;

    bool empty() const { return root_ == nullptr; }
    Node* root() const { return root_; }

    Node* FindNode(Key key) const {
        Node* n = root_;
        while (n) {
            const Key k = n->key();
            if (k == key)
                break;
            n = n->child(k < key);
        }
        return n;
    }

    // The node with the smallest key at least `key`, or null. The descent picks children
    // by index rather than by branch: the direction at each level is a coin toss that the
    // processor cannot predict.
    Node* GetMinGTOrEqNode(Key key) const {
        Node* below;
        return GetMinGTOrEqNode(key, below);
    }
    // As above; `below` receives the node with the largest key under `key` (or null), which
    // is the in-order predecessor of the answer.
    Node* GetMinGTOrEqNode(Key key, Node*& below) const {
        Node* best = nullptr;
        below = nullptr;
        for (Node* n = root_; n;) {
            const bool goRight = n->key() < key;
            best = goRight ? best : n;
            below = goRight ? n : below;
            n = n->child(goRight);
        }
        return best;
    }

    // The node with the largest key at most `key`, or null.
    Node* GetMaxLTOrEqNode(Key key) const {
        Node* best = nullptr;
        for (Node* n = root_; n;) {
            const bool goLeft = key < n->key();
            best = goLeft ? best : n;
            n = n->child(!goLeft);
        }
        return best;
    }

    // True when a node with `key` is in the tree (state.found); otherwise state names the
    // empty place for it, valid until the tree next changes.
    bool SetSearchState(tree_search_state<Node>& state, Key key) const {
        state = tree_search_state<Node>{};
        Node* parent = nullptr;
        bool right = false;
        for (Node* n = root_; n;) {
            const Key k = n->key();
            if (k == key) {
                state.found = n;
                return true;
            }
            parent = n;
            right = k < key;
            n = n->child(right);
        }
        state.parent = parent;
        state.asLeftChild = !right;
        return false;
    }

    // Links `node` at the empty place found by SetSearchState.
    void InsertNodeReference(const tree_search_state<Node>& state, Node* node) {
        node->setLeft(nullptr);
        node->setRight(nullptr);
        node->setParent(state.parent);
        node->setColour(ZYRRBParent::kRed);
        if (!state.parent)
            root_ = node;
        else if (state.asLeftChild)
            state.parent->setLeft(node);
        else
            state.parent->setRight(node);
        rebalanceAfterInsert(node);
    }

    // False (and nothing linked) when a node with the same key is already in the tree.
    bool InsertNodeReference(Node* node) {
        tree_search_state<Node> state;
        if (SetSearchState(state, node->key()))
            return false;
        InsertNodeReference(state, node);
        return true;
    }

    // Unlinks the node with `key` and hands it back, or null when there is none.
    Node* DeleteNodeReference(Key key) {
        Node* n = FindNode(key);
        if (n)
            UnlinkNode(n);
        return n;
    }

    // Puts `replacement` (not in the tree, same key) where `node` is, in O(1).
    void ReplaceNode(Node* node, Node* replacement) {
        replacement->setLeft(node->left());
        replacement->setRight(node->right());
        replacement->setParent(node->parent());
        replacement->setColour(node->colour());
        if (Node* l = node->left())
            l->setParent(replacement);
        if (Node* r = node->right())
            r->setParent(replacement);
        replaceChild(node->parent(), node, replacement);
    }

    void UnlinkNode(Node* z);

    bool InsertNode(Node* node) { return InsertNodeReference(node); }
    // Links a copy made with new; null (and no copy kept) when the key is already present.
    Node* InsertCopyOfNode(const Node& node) {
        Node* copy = new Node(node);
        if (InsertNodeReference(copy))
            return copy;
        delete copy;
        return nullptr;
    }
    bool DeleteNode(Key key) {
        Node* n = DeleteNodeReference(key);
        delete n;
        return n != nullptr;
    }
    void RemoveNode(Node* node) {
        UnlinkNode(node);
        delete node;
    }
    void DeleteAllNodes() {
        deleteSubtree(root_);
        root_ = nullptr;
    }
    // Empties the tree without touching the nodes (for nodes that live in someone's memory).
    void ForgetAllNodes() { root_ = nullptr; }

    iterator begin() const {
        Node* n = root_;
        while (n && n->left())
            n = n->left();
        return iterator(n);
    }
    iterator end() const { return iterator(); }

    // Verifies links, ordering, colours and black heights; null when sound, else what broke.
    const char* checkTree(unsigned long long* nodeCount = nullptr) const {
        unsigned long long count = 0;
        if (root_ && (root_->isRed() || root_->parent()))
            return "root is red or has a parent";
        int blackHeight = 0;
        const char* why = checkSubtree(root_, nullptr, nullptr, count, blackHeight);
        if (nodeCount)
            *nodeCount = count;
        return why;
    }

private:
    static bool isRed(const Node* n) { return n && n->isRed(); }

    void replaceChild(Node* parent, Node* oldChild, Node* newChild) {
        if (!parent)
            root_ = newChild;
        else if (parent->left() == oldChild)
            parent->setLeft(newChild);
        else
            parent->setRight(newChild);
    }

    void rotateLeft(Node* x) {
        Node* y = x->right();
        x->setRight(y->left());
        if (y->left())
            y->left()->setParent(x);
        y->setParent(x->parent());
        replaceChild(x->parent(), x, y);
        y->setLeft(x);
        x->setParent(y);
    }

    void rotateRight(Node* x) {
        Node* y = x->left();
        x->setLeft(y->right());
        if (y->right())
            y->right()->setParent(x);
        y->setParent(x->parent());
        replaceChild(x->parent(), x, y);
        y->setRight(x);
        x->setParent(y);
    }

    void rebalanceAfterInsert(Node* z);
    void rebalanceAfterUnlink(Node* x, Node* xParent);

    static void deleteSubtree(Node* n) {
        while (n) {
            deleteSubtree(n->right());
            Node* left = n->left();
            delete n;
            n = left;
        }
    }

    static const char* checkSubtree(const Node* n, const Node* low, const Node* high,
                                    unsigned long long& count, int& blackHeight) {
        if (!n) {
            blackHeight = 1;
            return nullptr;
        }
        ++count;
        if ((low && !(low->key() < n->key())) || (high && !(n->key() < high->key())))
            return "keys out of order or repeated";
        if ((n->left() && n->left()->parent() != n) || (n->right() && n->right()->parent() != n))
            return "child does not point back to its parent";
        if (n->isRed() && (isRed(n->left()) || isRed(n->right())))
            return "red node with a red child";
        int leftHeight = 0;
        int rightHeight = 0;
        if (const char* why = checkSubtree(n->left(), low, n, count, leftHeight))
            return why;
        if (const char* why = checkSubtree(n->right(), n, high, count, rightHeight))
            return why;
        if (leftHeight != rightHeight)
            return "black heights differ";
        blackHeight = leftHeight + (n->isRed() ? 0 : 1);
        return nullptr;
    }

    Node* root_ = nullptr;
};

template <class Node, class Key> void redblack_tree<Node, Key>::rebalanceAfterInsert(Node* z) {
    while (z != root_ && z->parent()->isRed()) {
        Node* p = z->parent();
        Node* g = p->parent(); // exists: a red node is never the root
        const bool parentIsLeft = p == g->left();
        Node* uncle = parentIsLeft ? g->right() : g->left();
        if (isRed(uncle)) {
            p->setColour(ZYRRBParent::kBlack);
            uncle->setColour(ZYRRBParent::kBlack);
            g->setColour(ZYRRBParent::kRed);
            z = g;
            continue;
        }
        if (parentIsLeft) {
            if (z == p->right()) {
                rotateLeft(p);
                p = z;
            }
            rotateRight(g);
        } else {
            if (z == p->left()) {
                rotateRight(p);
                p = z;
            }
            rotateLeft(g);
        }
        p->setColour(ZYRRBParent::kBlack);
        g->setColour(ZYRRBParent::kRed);
        break;
    }
    root_->setColour(ZYRRBParent::kBlack);
}

// Relinks rather than copying keys: nodes are identified by their address.
template <class Node, class Key> void redblack_tree<Node, Key>::UnlinkNode(Node* z) {
    Node* x;
    Node* xParent;
    ZYRRBParent::eColour removedColour;
    if (!z->left() || !z->right()) {
        x = z->left() ? z->left() : z->right();
        xParent = z->parent();
        removedColour = z->colour();
        if (x)
            x->setParent(xParent);
        replaceChild(xParent, z, x);
    } else {
        // The successor y takes z's place and colour; the colour lost is y's own.
        Node* y = z->right();
        while (y->left())
            y = y->left();
        x = y->right();
        removedColour = y->colour();
        if (y == z->right()) {
            xParent = y;
        } else {
            xParent = y->parent();
            if (x)
                x->setParent(xParent);
            xParent->setLeft(x);
            y->setRight(z->right());
            z->right()->setParent(y);
        }
        y->setLeft(z->left());
        z->left()->setParent(y);
        y->setParent(z->parent());
        y->setColour(z->colour());
        replaceChild(z->parent(), z, y);
    }
    if (removedColour == ZYRRBParent::kBlack)
        rebalanceAfterUnlink(x, xParent);
}

template <class Node, class Key>
void redblack_tree<Node, Key>::rebalanceAfterUnlink(Node* x, Node* xParent) {
    // x carries an extra black until it is red (paint it) or the root.
    while (x != root_ && !isRed(x)) {
        const bool xIsLeft = x == xParent->left();
        Node* w = xIsLeft ? xParent->right() : xParent->left(); // exists: black height >= 1
        if (w->isRed()) {
            w->setColour(ZYRRBParent::kBlack);
            xParent->setColour(ZYRRBParent::kRed);
            if (xIsLeft)
                rotateLeft(xParent);
            else
                rotateRight(xParent);
            w = xIsLeft ? xParent->right() : xParent->left();
        }
        Node* nearChild = xIsLeft ? w->left() : w->right();
        Node* farChild = xIsLeft ? w->right() : w->left();
        if (!isRed(nearChild) && !isRed(farChild)) {
            w->setColour(ZYRRBParent::kRed);
            x = xParent;
            xParent = x->parent();
            continue;
        }
        if (!isRed(farChild)) {
            nearChild->setColour(ZYRRBParent::kBlack);
            w->setColour(ZYRRBParent::kRed);
            if (xIsLeft)
                rotateRight(w);
            else
                rotateLeft(w);
            w = xIsLeft ? xParent->right() : xParent->left();
            farChild = xIsLeft ? w->right() : w->left();
        }
        w->setColour(xParent->colour());
        xParent->setColour(ZYRRBParent::kBlack);
        farChild->setColour(ZYRRBParent::kBlack);
        if (xIsLeft)
            rotateLeft(xParent);
        else
            rotateRight(xParent);
        x = root_;
        break;
    }
    if (x)
        x->setColour(ZYRRBParent::kBlack);
}

} // namespace ZYRStd
