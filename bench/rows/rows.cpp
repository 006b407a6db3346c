#include "rows.h"

#include "rows/support.h"

#include <iterator>

namespace bench {

std::vector<Row> Rows(std::size_t scale) {
    std::vector<Row> all;
    for (std::vector<Row> group : {FolderRows(), QueueRows(scale), ServiceRows(), ProcessRows(scale)}) {
        std::move(group.begin(), group.end(), std::back_inserter(all));
    }
    return all;
}

}  // namespace bench
