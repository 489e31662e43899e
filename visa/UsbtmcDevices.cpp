// SPDX-License-Identifier: Apache-2.0
#include "UsbtmcDevices.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <optional>
#include <system_error>

namespace visa {

namespace {

namespace fs = std::filesystem;

constexpr std::size_t LongestAttribute = 256; // a USB string has 126 characters at most

std::string readAttribute(const fs::path &path)
{
    std::ifstream file(path);
    std::string text(LongestAttribute, '\0');
    file.read(text.data(), static_cast<std::streamsize>(text.size()));
    text.resize(static_cast<std::size_t>(file.gcount()));
    const std::size_t end = text.find_first_of("\r\n");
    return text.substr(0, end);
}

std::optional<ViUInt16> readHexadecimal(const fs::path &path)
{
    return parseNumber("0x" + readAttribute(path));
}

std::optional<UsbtmcDevice> readDevice(const std::string &root, const std::string &node)
{
    // The class folder links to the interface; the device that it belongs to is the folder above.
    std::error_code error;
    const fs::path interface =
        fs::canonical(root + "/sys/class/usbmisc/" + node + "/device", error);
    if (error) {
        return std::nullopt;
    }
    const fs::path device = interface.parent_path();
    const auto vendor = readHexadecimal(device / "idVendor");
    const auto product = readHexadecimal(device / "idProduct");
    const auto number = readHexadecimal(interface / "bInterfaceNumber");
    UsbtmcDevice result;
    result.name.kind = ResourceKind::Usb;
    result.name.serial = readAttribute(device / "serial");
    if (!vendor || !product || !number || result.name.serial.empty()) {
        return std::nullopt;
    }
    result.name.vendorId = *vendor;
    result.name.productId = *product;
    result.interface = *number;
    result.path = root + "/dev/" + node;
    return result;
}

std::optional<ViUInt16> nodeNumber(const std::string &node)
{
    constexpr std::string_view Prefix = "usbtmc";
    if (!node.starts_with(Prefix) || node.starts_with("usbtmc0x")) {
        return std::nullopt;
    }
    return parseNumber(std::string_view(node).substr(Prefix.size()));
}

} // namespace

std::vector<UsbtmcDevice> findUsbtmcDevices(const std::string &root)
{
    std::vector<std::pair<ViUInt16, std::string>> nodes;
    std::error_code error;
    fs::directory_iterator entry(root + "/sys/class/usbmisc", error);
    for (; !error && entry != fs::directory_iterator(); entry.increment(error)) {
        const std::string node = entry->path().filename().string();
        if (const auto number = nodeNumber(node)) {
            nodes.emplace_back(*number, node);
        }
    }
    std::sort(nodes.begin(), nodes.end());

    std::vector<UsbtmcDevice> devices;
    for (const auto &[number, node] : nodes) {
        if (auto device = readDevice(root, node)) {
            devices.push_back(std::move(*device));
        }
    }
    std::vector<ResourceName> names;
    names.reserve(devices.size());
    for (const UsbtmcDevice &device : devices) {
        names.push_back(device.name);
    }
    for (UsbtmcDevice &device : devices) {
        if (std::count(names.begin(), names.end(), device.name) > 1) {
            device.name.usbInterface = device.interface;
        }
    }
    return devices;
}

std::string findUsbtmcPath(const std::vector<UsbtmcDevice> &devices, const ResourceName &name)
{
    for (const UsbtmcDevice &device : devices) {
        if (device.name.vendorId == name.vendorId && device.name.productId == name.productId &&
            device.name.serial == name.serial &&
            name.usbInterface.value_or(device.interface) == device.interface) {
            return device.path;
        }
    }
    return {};
}

} // namespace visa
