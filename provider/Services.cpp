#include "Services.h"

namespace provider {

std::vector<std::unique_ptr<Service>> makeServices(Context& context) {
    std::vector<std::unique_ptr<Service>> services;
    services.push_back(std::make_unique<TokenService>(context));
    services.push_back(std::make_unique<CalendarService>(context));
    services.push_back(std::make_unique<TaskService>(context));
    services.push_back(std::make_unique<ContactService>(context));
    services.push_back(std::make_unique<PeopleService>(context));
    services.push_back(std::make_unique<AdminDataService>(context));
    services.push_back(std::make_unique<AdminTaskService>(context));
    services.push_back(std::make_unique<AdminContactService>(context));
    services.push_back(std::make_unique<AdminControlService>(context));
    services.push_back(std::make_unique<PageService>());
    return services;
}

}  // namespace provider
