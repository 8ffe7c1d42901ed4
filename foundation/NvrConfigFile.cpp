#include "foundation/NvrConfigFile.h"

#include <cctype>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <sys/stat.h>

#include "foundation/CLogger.h"
#include "foundation/open_file.h"
#include "runtime/Undisturbed.h"

namespace cimple {

const char* const provider_config_path = "/etc/norvane_fc_provider.conf";

namespace {

constexpr char key_cache_timeout[] = "NVR_PROVIDER_CACHE_TIMEOUT";
constexpr char key_refresh_adapter_data[] = "NVR_PROVIDER_REFRESH_ADAPTERDATA";
constexpr char key_refresh_san_data[] = "NVR_PROVIDER_REFRESH_SANDATA";

constexpr long min_cache_timeout = 1;
constexpr long max_cache_timeout = 30;

bool is_space(char c)
{
    return std::isspace(static_cast<unsigned char>(c)) != 0;
}

// Cuts white space off both ends, in place.
char* trim(char* text)
{
    while (is_space(*text))
        text++;
    std::size_t size = std::strlen(text);
    while (size > 0 && is_space(text[size - 1]))
        size--;
    text[size] = '\0';
    return text;
}

bool read_flag(const char* value, std::atomic<bool>& flag)
{
    if (std::strcmp(value, "TRUE") == 0)
        flag = true;
    else if (std::strcmp(value, "FALSE") == 0)
        flag = false;
    else
        return false;
    return true;
}

bool read_timeout(const char* value, std::atomic<uint32>& minutes)
{
    const long number = std::strtol(value, nullptr, 10);
    if (number < min_cache_timeout || number > max_cache_timeout) return false;
    minutes = static_cast<uint32>(number);
    return true;
}

} // namespace

NvrConfigFile::~NvrConfigFile()
{
    saveForGood();
}

void NvrConfigFile::load(const char* path)
{
    m_path = path;
    {
        struct stat status;
        const bool is_there = ::stat(m_path.c_str(), &status) == 0;
        if (errno == ENOENT) { // also a stale one: only errno is tested
            m_unread = is_there;
            return;
        }
    }
    Line_Reader file(m_path.c_str());
    m_unread = file.has_failed();
    if (!file.is_open()) {
        NVR_LOG("Unable to open provider config setting file - %s", m_path.c_str());
        return;
    }
    bool seen_timeout = false;
    bool seen_adapter_data = false;
    bool seen_san_data = false;
    char buffer[1024];
    for (int lines = 0; lines < 1000 && file.read(buffer); lines++) {
        char* line = trim(buffer);
        char* equals = std::strchr(line, '=');
        if (*line == '#' || !equals) continue;
        *equals = '\0';
        const char* key = trim(line);
        const char* value = trim(equals + 1);
        if (!seen_timeout && std::strcmp(key, key_cache_timeout) == 0)
            seen_timeout = read_timeout(value, m_cacheTimeout);
        else if (!seen_adapter_data && std::strcmp(key, key_refresh_adapter_data) == 0)
            seen_adapter_data = read_flag(value, m_refreshAdapterData);
        else if (!seen_san_data && std::strcmp(key, key_refresh_san_data) == 0)
            seen_san_data = read_flag(value, m_refreshSANData);
    }
    m_unread = file.has_failed();
}

void NvrConfigFile::save()
{
    Undisturbed undisturbed;
    char text[400];
    std::snprintf(text, sizeof text,
                  "##################################################\n"
                  "# Norvane HBA CIM Provider Configuration Settings #\n"
                  "##################################################\n"
                  "%s = %d\n"
                  "%s = %s\n"
                  "%s = %s\n",
                  key_cache_timeout, static_cast<int>(getCacheTimeout()), key_refresh_adapter_data,
                  getRefreshAdapterData() ? "TRUE" : "FALSE", key_refresh_san_data,
                  getRefreshSANData() ? "TRUE" : "FALSE");
    write_text(m_path.c_str(), text);
}

void NvrConfigFile::saveForGood()
{
    if (m_saved_for_good) return;
    m_saved_for_good = true;
    if (!m_unread) save();
}

uint32 NvrConfigFile::getCacheTimeout() const
{
    return m_cacheTimeout;
}

bool NvrConfigFile::getRefreshAdapterData() const
{
    return m_refreshAdapterData;
}

bool NvrConfigFile::getRefreshSANData() const
{
    return m_refreshSANData;
}

int NvrConfigFile::setCacheTimeout(uint32 minutes)
{
    if (minutes < min_cache_timeout || minutes > max_cache_timeout) return -1;
    m_cacheTimeout = minutes;
    m_unread = false;
    return 0;
}

int NvrConfigFile::setRefreshAdapterData(uint32 flag)
{
    if (flag > 1) return -1;
    m_refreshAdapterData = flag == 1;
    m_unread = false;
    return 0;
}

int NvrConfigFile::setRefreshSANData(uint32 flag)
{
    if (flag > 1) return -1;
    m_refreshSANData = flag == 1;
    m_unread = false;
    return 0;
}

std::string readWebLaunchURL()
{
    static const char path[] = "/etc/nvr_smis.conf";
    Undisturbed undisturbed;
    Line_Reader file(path);
    if (!file.is_open()) {
        NVR_LOG("WebLaunch config file '%s' not found.", path);
        return "";
    }
    char line[256];
    bool is_rest = false; // the rest of a long comment is no line of its own
    for (int pieces = 0; pieces < 10000 && file.read(line); pieces++) {
        const bool is_whole = std::strchr(line, '\n') != nullptr;
        line[std::strcspn(line, "\n")] = '\0';
        const char* text = line;
        while (is_space(*text))
            text++;
        if (!is_rest && *text != '\0' && *text != '#') return text;
        is_rest = !is_whole;
    }
    return "";
}

} // namespace cimple
