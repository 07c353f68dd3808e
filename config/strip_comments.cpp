#include "config/strip_comments.h"

namespace config {

std::string strip_comments::strip(const std::string& line, char commentChar) {
    enum class Quoting { Outside, Inside, JustClosed };
    Quoting state = Quoting::Outside;
    for (std::size_t i = 0; i < line.size(); ++i) {
        const char c = line[i];
        switch (state) {
        case Quoting::Outside:
            if (c == '"')
                state = Quoting::Inside;
            else if (c == commentChar)
                return line.substr(0, i);
            break;
        case Quoting::Inside:
            if (c == '"')
                state = Quoting::JustClosed;
            break;
        case Quoting::JustClosed:
            if (c == '"')
                state = Quoting::Inside;
            else if (c == commentChar)
                return line.substr(0, i);
            else
                state = Quoting::Outside;
            break;
        }
    }
    return line;
}

} // namespace config
