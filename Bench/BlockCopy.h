#pragma once

#include <algorithm>
#include <cstddef>
#include <vector>

namespace TestSupport {

// An input and the block it is copied to before each timed call. The two are kept half a page apart: copies
// between addresses that agree in their low twelve bits run several times slower, which would end up in the
// measurement or not as the allocator pleases.
template <typename Sample>
class BlockCopy {
public:
    explicit BlockCopy(const std::vector<Sample>& input) : m_count(input.size()) {
        constexpr std::size_t kPage = 4096 / sizeof(Sample);
        const std::size_t distance = (m_count + kPage - 1) / kPage * kPage + kPage / 2;
        m_memory.resize(distance + m_count);
        m_block = m_memory.data() + distance;
        std::ranges::copy(input, m_memory.begin());
    }
    // The block, filled with the input afresh.
    Sample* Fresh() {
        std::copy_n(m_memory.data(), m_count, m_block);
        return m_block;
    }

private:
    std::size_t m_count;
    std::vector<Sample> m_memory;
    Sample* m_block;
};

}  // namespace TestSupport
