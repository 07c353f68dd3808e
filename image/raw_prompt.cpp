#include "image/raw_prompt.h"

#include <cstring>

#include "image/image_buffer.h"
#include "image/image_messages.h"
#include "image/image_result.h"

namespace img {

namespace {

class Console {
public:
    Console(std::FILE* in, std::FILE* out) : in_(in), out_(out) {}

    // One answer line without its end of line; false at the end of input.
    bool answer(const char* question) {
        std::fputs(question, out_);
        std::fflush(out_);
        if (!std::fgets(line_, sizeof line_, in_))
            return false;
        const std::size_t length = std::strlen(line_);
        if (length > 0 && line_[length - 1] == '\n') {
            line_[length - 1] = '\0';
        } else if (!std::feof(in_)) {
            int c; // the rest of an overlong line belongs to this answer
            while ((c = std::fgetc(in_)) != EOF && c != '\n') {
            }
        }
        return true;
    }
    const char* line() const { return line_; }

    // Asks until the answer is a whole decimal number; false at the end of input.
    bool number(const char* question, std::uint64_t limit, std::uint64_t* value) {
        while (answer(question))
            if (parseNumber(line_, limit, value))
                return true;
        return false;
    }

    // Asks until the number lies in first..last, writing `error` after each miss.
    bool choice(const char* question, const char* error, std::uint64_t first, std::uint64_t last,
                std::uint64_t* value) {
        while (answer(question)) {
            if (parseNumber(line_, last, value) && *value >= first)
                return true;
            std::fputs(error, out_);
        }
        return false;
    }

private:
    // Digits with optional blanks around them, at most `limit`; no locale involved.
    static bool parseNumber(const char* text, std::uint64_t limit, std::uint64_t* value) {
        while (*text == ' ' || *text == '\t' || *text == '\r')
            ++text;
        if (*text == '+')
            ++text;
        if (*text < '0' || *text > '9')
            return false;
        std::uint64_t v = 0;
        for (; *text >= '0' && *text <= '9'; ++text) {
            const auto digit = static_cast<std::uint64_t>(*text - '0');
            if (digit > limit || v > (limit - digit) / 10)
                return false;
            v = v * 10 + digit;
        }
        while (*text == ' ' || *text == '\t' || *text == '\r')
            ++text;
        if (*text != '\0')
            return false;
        *value = v;
        return true;
    }

    std::FILE* in_;
    std::FILE* out_;
    char line_[256];
};

constexpr std::uint32_t kCfaOfChoice[] = {kCfaRggb, kCfaBggr, kCfaGrbg, kCfaGbrg};

} // namespace

int askRawLayout(std::FILE* in, std::FILE* out, std::FILE* err, RawLayout* layout) noexcept {
    Console console(in, out);
    std::fputs(msg::kPromptIntro, out);
    std::uint64_t width, height, bits, bayer, images, header;
    const bool complete =
        console.number(msg::kPromptWidth, UINT32_MAX, &width) &&
        console.number(msg::kPromptHeight, UINT32_MAX, &height) &&
        console.choice(msg::kPromptBitDepth, msg::kPromptBitDepthError, 1, 16, &bits) &&
        console.choice(msg::kPromptBayer, msg::kPromptBayerError, 1, 4, &bayer) &&
        console.answer(msg::kPromptEndian) &&
        [&] {
            const char* text = console.line();
            while (*text == ' ' || *text == '\t')
                ++text;
            layout->littleEndian = *text == 'Y' || *text == 'y';
            return true;
        }() &&
        console.number(msg::kPromptImages, UINT32_MAX, &images) &&
        console.number(msg::kPromptHeaderSize, UINT64_MAX, &header);
    if (!complete) {
        std::fputs("\n", out);
        std::fflush(out);
        std::fputs(msg::kPromptNoAnswer, err);
        std::fflush(err);
        return kIoError;
    }
    layout->width = static_cast<std::uint32_t>(width);
    layout->height = static_cast<std::uint32_t>(height);
    layout->bitDepth = static_cast<std::uint32_t>(bits);
    layout->cfa = kCfaOfChoice[bayer - 1];
    layout->images = static_cast<std::uint32_t>(images);
    layout->headerSize = header;
    return kOk;
}

} // namespace img
