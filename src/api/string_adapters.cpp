#include "api/string_adapters.h"

#include "api/ZELServerString.h"
#include "api/text_encoding.h"

namespace zel {

const char* ZELROStringArrayWrapper::element(unsigned index) const
{
    return target_ && index < target_->entries() ? target_->element(index) : "";
}

int ZELROStringArrayWrapper::getElement(unsigned index, IZELString& out) const
{
    if (target_ == nullptr || index >= target_->entries()) {
        return 1;
    }
    // Through the list's getElement rather than element(), which would stop at an embedded NUL.
    ZELServerString value;
    target_->getElement(index, value);
    out.set(value.data(), value.length());
    return 0;
}

bool ZELROStringArrayWrapper::contains(const IZELString& value) const
{
    if (target_ == nullptr) {
        return false;
    }
    // A null data pointer makes the empty text.
    return target_->contains(ZELServerString(value.data(), value.length()));
}

bool ZELROStringArrayWrapper::contains(const char* value) const
{
    return target_ != nullptr && target_->contains(value ? value : "");
}

ZELObsoleteStringImp& ZELObsoleteStringImp::operator=(const ZELObsoleteStringImp& other)
{
    text_ = other.text_;
    return *this;
}

const char* ZELObsoleteStringImp::assign(const char* text)
{
    if (text == nullptr) {
        text_.clear();
    } else {
        text_.assign(text);
    }
    return text;
}

void ZELObsoleteStringImp::set(const char* data, unsigned length)
{
    if (data == nullptr) {
        text_.clear();
    } else {
        text_.assign(data, length);
    }
}

void ZELObsoleteStringImp::encodeTo(int selector)
{
    if (selector == kLatin1Selector) {
        text_ = utf8ToLatin1(text_);
    }
}

void ZELObsoleteStringImp::decodeFrom(int selector)
{
    if (selector == kLatin1Selector) {
        text_ = latin1ToUtf8(text_);
    }
}

}  // namespace zel
