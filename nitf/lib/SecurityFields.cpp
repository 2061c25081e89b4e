#include "SecurityFields.h"

#include <map>
#include <memory>
#include <mutex>
#include <set>
#include <string>

using namespace record;

// Names built from a prefix live as long as the program, like the literals of the other tables.
static const char* intern(const std::string& name) {
    static std::set<std::string> names;
    return names.insert(name).first->c_str();
}

// Each group is built once per prefix and kept.
template <typename Build> static const std::vector<Entry>& cached(const std::string& key, Build build) {
    static std::mutex guard;
    static std::map<std::string, std::unique_ptr<std::vector<Entry>>> groups;
    std::lock_guard<std::mutex> lock(guard);
    std::unique_ptr<std::vector<Entry>>& group = groups[key];
    if (!group)
        group.reset(new std::vector<Entry>(build()));
    return *group;
}

const std::vector<Entry>& securityFields21(const char* prefix) {
    return cached(std::string("21:") + prefix, [prefix] {
        static const struct {
            const char* suffix;
            int width;
        } group[] = {{"CLAS", 1},  {"CLSY", 2}, {"CODE", 11}, {"CTLH", 2}, {"REL", 20},  {"DCTP", 2},
                     {"DCDT", 8},  {"DCXM", 4}, {"DG", 1},    {"DGDT", 8}, {"CLTX", 43}, {"CATP", 1},
                     {"CAUT", 40}, {"CRSN", 1}, {"SRDT", 8},  {"CTLN", 15}};
        std::vector<Entry> fields;
        for (const auto& field : group)
            fields.push_back(Text(intern(std::string(prefix) + field.suffix), field.width));
        return fields;
    });
}

const std::vector<Entry>& securityFields20(const char* prefix, const char* controlName, bool alwaysEvent) {
    std::string key =
        std::string("20:") + prefix + ":" + (controlName ? controlName : "") + (alwaysEvent ? "!" : "");
    return cached(key, [prefix, controlName, alwaysEvent] {
        std::string p(prefix);
        const char* downgrade = intern(p + "DWNG");
        std::vector<Entry> fields = {
            Text(intern(p + "CLAS"), 1),
            Text(intern(p + "CODE"), 40),
            Text(controlName ? controlName : intern(p + "CTLH"), 40),
            Text(intern(p + "REL"), 40),
            Text(intern(p + "CAUT"), 20),
            Text(intern(p + "CTLN"), 20),
            Text(downgrade, 6),
        };
        if (!alwaysEvent)
            fields.push_back(IfText(downgrade, "999998"));
        fields.push_back(Text(intern(p + "DEVT"), 40));
        if (!alwaysEvent)
            fields.push_back(End());
        return fields;
    });
}
