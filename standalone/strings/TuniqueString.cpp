#include "host/TuniqueString.h"

#include "standalone/strings/Fnv1a.h"

#include <array>
#include <atomic>
#include <memory>
#include <string>
#include <string_view>

// One interned text, and a link of its bucket's chain.
//
// Entries are added at the head of a chain and never removed, so that readers need no lock. The
// table is constant-initialised and never destroyed: constructors and destructors of other modules'
// static objects may use it.
struct TuniqueString::Entry {
    std::string text;
    std::uint64_t hash;
    const Entry* next;

    // Returns the entry of `text`, created if there is none.
    static const Entry* intern(std::string_view text);

private:
    // Texts are names of attributes and data, some thousands in a large scene: chains are short.
    static constexpr std::size_t kBucketCount = 1u << 14;
    static std::array<std::atomic<const Entry*>, kBucketCount> buckets;

    static const Entry* find(const Entry* head, const Entry* end, std::string_view text,
                             std::uint64_t hash);
};

constinit std::array<std::atomic<const TuniqueString::Entry*>, TuniqueString::Entry::kBucketCount>
    TuniqueString::Entry::buckets{};

// Returns the entry of `text` in the chain from `head` to, not including, `end`, or null.
const TuniqueString::Entry* TuniqueString::Entry::find(const Entry* head, const Entry* end,
                                                       std::string_view text, std::uint64_t hash)
{
    for (const Entry* entry = head; entry != end; entry = entry->next) {
        if (entry->hash == hash && entry->text == text) {
            return entry;
        }
    }
    return nullptr;
}

const TuniqueString::Entry* TuniqueString::Entry::intern(std::string_view text)
{
    const auto hash = vyra::host::fnv1a<std::uint64_t>(text);
    std::atomic<const Entry*>& bucket = buckets[hash % kBucketCount];
    const Entry* searched = bucket.load(std::memory_order_acquire);
    if (const Entry* known = find(searched, nullptr, text, hash)) {
        return known;
    }

    std::unique_ptr<Entry> entry(new Entry{std::string(text), hash, searched});
    while (!bucket.compare_exchange_weak(entry->next, entry.get(), std::memory_order_acq_rel,
                                         std::memory_order_acquire)) {
        // Other threads have added entries at the head, one of which may hold the text.
        if (const Entry* known = find(entry->next, searched, text, hash)) {
            return known;
        }
        searched = entry->next;
    }
    return entry.release();
}

TuniqueString::TuniqueString(const char* text) : fEntry(Entry::intern(text != nullptr ? text : ""))
{
}

const char* TuniqueString::asChar() const
{
    return fEntry->text.c_str();
}

std::uint64_t TuniqueString::hash() const
{
    return fEntry->hash;
}
