#include "blob/md5.h"

#include <memory>
#include <stdexcept>

#include "blob/blob_messages.h"

#include <openssl/evp.h>

namespace blob {

namespace {

struct DigestContextFree {
    void operator()(EVP_MD_CTX* context) const noexcept { EVP_MD_CTX_free(context); }
};
using DigestContextPtr = std::unique_ptr<EVP_MD_CTX, DigestContextFree>;

} // namespace

Md5Digest md5(const std::uint8_t* data, std::size_t size) {
    DigestContextPtr context(EVP_MD_CTX_new());
    Md5Digest digest{};
    unsigned length = 0;
    if (!context || EVP_DigestInit_ex(context.get(), EVP_md5(), nullptr) != 1 ||
        EVP_DigestUpdate(context.get(), data, size) != 1 ||
        EVP_DigestFinal_ex(context.get(), digest.data(), &length) != 1 || length != digest.size())
        throw std::runtime_error(msg::kDigestFailed);
    return digest;
}

} // namespace blob
