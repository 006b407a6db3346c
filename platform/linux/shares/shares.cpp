// Lookups of shares and of their recycle bins.
#include "base/path_cover.h"
#include "common/failure.h"
#include "shares/share_source.h"

#include <vork/error.h>
#include <vork/share.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>

using VORK::IsAtOrUnder;
using VORK::PLATFORM::Fail;
using VORK::PLATFORM::IsComponent;
using VORK::PLATFORM::Share;
using VORK::PLATFORM::Shares;
using VORK::PLATFORM::ShareSource;

namespace {

// What VORKShareGet hands out: the public record in front, the texts it points to after it.
struct OwningRecord : VORKSHARE {
    explicit OwningRecord(const Share &share) : VORKSHARE{}, name(share.name), path(share.path) {
        szName = name.c_str();
        szPath = path.c_str();
    }

    std::string name;
    std::string path;
};

// The shares to look in. A source in trouble says so even when the lookup then succeeds from its last table.
ShareSource::Snapshot Look() {
    ShareSource::Snapshot snapshot = Shares().Current();
    if (snapshot.error != 0) {
        Fail(snapshot.error);
    }
    return snapshot;
}

bool CopyOut(const std::string &text, char *buffer, int size) {
    if (size < 0 || text.size() >= static_cast<size_t>(size)) {
        return false;
    }
    std::memcpy(buffer, text.c_str(), text.size() + 1);
    return true;
}

bool IsInBinOf(const Share *share, std::string_view fullPath) {
    return !share->recycle.empty() && IsAtOrUnder(fullPath, share->path + "/" + share->recycle);
}

}  // namespace

int VORKShareGet(const char *szName, struct _tag_VORKSHARE **ppShare) try {
    if (szName == nullptr || ppShare == nullptr || !IsComponent(szName)) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const ShareSource::Snapshot snapshot = Look();
    const Share *share = snapshot.table->Find(szName);
    if (share == nullptr) {
        return Fail(snapshot.error != 0 ? snapshot.error : snapshot.table->WhyNot(szName));
    }
    *ppShare = new OwningRecord(*share);
    return 0;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}

void VORKShareFree(struct _tag_VORKSHARE *pShare) {
    delete static_cast<OwningRecord *>(pShare);
}

int VORKShareNamePathGet(const char *szFullPath, char *szName, int cbName, char *szPath, int cbPath) try {
    if (szFullPath == nullptr || szName == nullptr || szPath == nullptr || szFullPath[0] != '/') {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    const ShareSource::Snapshot snapshot = Look();
    const Share *share = snapshot.table->Holding(szFullPath);
    if (share == nullptr) {
        return Fail(snapshot.error != 0 ? snapshot.error : VORK_ERR_NO_SUCH_SHARE);
    }
    if (!CopyOut(share->name, szName, cbName) || !CopyOut(share->path, szPath, cbPath)) {
        return Fail(VORK_ERR_BAD_PARAMETER);
    }
    return 0;
} catch (const std::exception &) {
    return Fail(VORK_ERR_IO);
}

int VORKShareIsShareRecycle(const char *szFullPath) try {
    if (szFullPath == nullptr || szFullPath[0] != '/') {
        return 0;
    }
    const ShareSource::Snapshot snapshot = Look();
    const auto holding = snapshot.table->AllHolding(szFullPath);
    const std::string_view path = szFullPath;
    return std::any_of(holding.begin(), holding.end(),
                       [path](const Share *share) { return IsInBinOf(share, path); })
               ? 1
               : 0;
} catch (const std::exception &) {
    return 0;
}
